#ifndef SSOCLIENT_ACCESS_TRUST_STORE_H
#define SSOCLIENT_ACCESS_TRUST_STORE_H

#include <cstddef>
#include <memory>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include <ssoclient/access/export.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/system/date_time.h>

namespace SsoClient::Access {

/// Who may sign tokens of an issuer.
///
/// Paths are those of files and folders. Of a folder, the files directly in it count whose names
/// end in ".pem", ".crt" or ".cer", for lists also ".crl", and do not begin with a dot. Symbolic
/// links are followed. A file contains PEM blocks (RFC 7468) or one DER encoding, in at most 16
/// MiB; blocks of other kinds, such as private keys, are skipped. Pipes, devices and, within a
/// folder, other folders are errors where a file is expected. Relative paths are resolved when the
/// store is created.
struct TrustedIssuer {
  /// The text of the tokens' Issuer (SAML 2.0 core, section 2.2.5), compared byte for byte. Must
  /// not be empty unless `isForAnyIssuer`. Several entries for one issuer are used together.
  std::string issuer{};
  /// True, with an empty `issuer`, if the certificates may sign tokens of every issuer: only right
  /// when there is one service, since each could sign in the name of another.
  bool isForAnyIssuer = false;
  /// The certificates of the signing keys themselves. A certificate that one of them has issued is
  /// not trusted. Of the certificates that a token's KeyInfo may mean, the first 16 are tried; that
  /// matters only if it names none, so that it may mean all.
  std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>> certificates{};
  /// Files with such certificates, and folders of such files.
  std::vector<std::string> certificatePaths{};
  /// Certificate revocation lists (RFC 5280, section 5). Without paths, revocation is not checked.
  /// With them, each of the certificates must be covered by a list of its issuer that is not out of
  /// date, or no token that it signed is accepted: also when a folder contains no list yet. Of
  /// several lists that cover a certificate, the one with the latest thisUpdate counts, and all of
  /// them if they have the same. A certificate on it is revoked even if the date of its revocation
  /// is in the future, and also after the list is out of date. If several certificates have signed
  /// lists, such as those of an authority's old and new key, it is revoked if the latest list of
  /// any of them says so. A certificate in several entries of an issuer is checked if one of them
  /// has lists, against the lists of all.
  std::vector<std::string> revocationListPaths{};
  /// The certificates of the authorities that sign these lists. They are not trusted to sign
  /// tokens. A list that none of them, and none of the certificates above, has signed is an error.
  std::vector<std::string> listSignerPaths{};
};

/// A trusted certificate, as it is used now.
struct TrustedSigner {
  std::string issuer{};                                          ///< `TrustedIssuer::issuer`
  Tarnik::Ref<const Tarnik::Crypto::Certificate> certificate{};  ///< of the key that may sign
  std::string path{};  ///< the file that contained it; empty if it was given as an object
  bool isRevocationChecked = false;  ///< whether it must be covered by a list
  /// When it was revoked; none if it was not.
  boost::optional<Tarnik::System::DateTime> revokedSince{};
  /// When the list that covers it is out of date (nextUpdate); none without such a list.
  boost::optional<Tarnik::System::DateTime> listUntil{};
};

/// The trust in use, and the last attempt to read it.
struct TrustDescription {
  /// The certificates in use, also those that are revoked; one that is trusted for two issuers is
  /// in it twice.
  std::vector<TrustedSigner> signers{};
  /// `TrustedIssuer::issuer` of the entries of which no signer is above, since their folders
  /// contain no certificate; empty for any issuer. Their tokens are refused, unless there are
  /// signers of any issuer.
  std::vector<std::string> issuersWithoutSigners{};
  Tarnik::System::DateTime loadedAt{};  ///< when the files were last read successfully
  /// Why the files as they are now were not accepted; empty if the trust in use is that of the
  /// files, as far as they have been looked at.
  std::string failure{};

  /// A text of several lines for people, which ends in a line feed.
  SSOCLIENT_ACCESS_EXPORT std::string ToString() const;
};

/// Changed files have been read, or could not be. The numbers are those of
/// `TrustDescription::signers`: a certificate that is trusted for two issuers counts twice.
struct TrustRecord {
  std::string store{};    ///< `TrustStoreConfig::name`
  std::string failure{};  ///< why the trust stays as it was; empty if it has been replaced
  std::vector<std::string> issuersWithoutSigners{};  ///< as in `TrustDescription`
  std::size_t added = 0;    ///< signers that were not trusted before, by issuer and SHA-256
  std::size_t removed = 0;  ///< signers that are no longer trusted, by issuer and SHA-256
  std::size_t signers = 0;  ///< signers in use now, with those that are revoked or uncovered
  std::size_t revoked = 0;  ///< of them, those that are revoked
  /// Of them, those that must be covered by a revocation list, but that no list covers. A list that
  /// is out of date still covers.
  std::size_t uncovered = 0;
};

/// Sees what a trust store does. The functions run on a worker thread of the platform, or on the
/// one that calls `TrustStore::Reload`, one at a time for each store. They must not call `Reload`
/// of their store, but may release it. Exceptions that leave them are ignored. None is called after
/// the destructor of the store has returned, which waits up to a second for one that runs on
/// another thread.
class SSOCLIENT_ACCESS_EXPORT TrustListener {
 public:
  virtual ~TrustListener();
  /// The trust has been replaced; or, after a failure, the files can be read again, even if the
  /// trust is what it was. Does nothing unless it is overridden, as does the next function.
  virtual void OnTrustReplaced(const TrustRecord& record);
  /// The files could not be read or decoded, and the trust stays as it was. Called once for each
  /// new failure, not again while the files stay as they are.
  virtual void OnTrustKept(const TrustRecord& record);
};

/// Writes a line to the log of the platform for each record: a replacement at level 4, a failure at
/// level 2.
SSOCLIENT_ACCESS_EXPORT std::shared_ptr<TrustListener> CreateTrustLogListener();

/// The entries of a trust store, and how it follows its files.
struct TrustStoreConfig {
  /// Names the store in records and log lines; may be empty.
  std::string name{};
  /// The entries: at least one, each with a certificate or the path of one.
  std::vector<TrustedIssuer> issuers{};
  /// Whether the store looks for changes of the files by itself. It does so four times a second, by
  /// their metadata, and reads changed files when they have stayed the same for a quarter of a
  /// second, or after three quarters at the latest: a change counts within a second.
  bool isWatching = true;
  /// May be null.
  std::shared_ptr<TrustListener> listener{};
};

/// The certificates that may sign tokens, from files that may change at any time. All files are
/// read together: either the whole trust is replaced, or, when any file cannot be read or decoded,
/// or a path does not exist, all of it stays as it was. A folder that exists and contains no
/// certificate is not an error: whoever removes the last certificate of an issuer takes its trust
/// away. Checks that are under way use the trust with which they began.
///
/// Replace a file by renaming a complete one over it. A file that is written in place may be read
/// when it is incomplete, which is usually an error, but not if its first part ends between two
/// certificates.
///
/// Thread-safe. In a forked child, a store that watches begins to watch again when it is used.
/// Created only by `CreateTrustStore`: a gate accepts no other implementation.
class SSOCLIENT_ACCESS_EXPORT TrustStore {
 public:
  virtual ~TrustStore();
  /// Reads all files now, on this thread. When it returns, the trust is that of the files. Throws
  /// what `CreateTrustStore` throws for files; the trust then stays as it was, and the listener has
  /// been called, unless it knows this failure already. Throws `Tarnik::InvalidStateException` in a
  /// function of the store's listener.
  virtual void Reload() = 0;
  /// The trust in use now, and the result of the last attempt to read the files. Reads no file.
  virtual TrustDescription Describe() const = 0;
};

/// Reads all files. Throws `Tarnik::InvalidArgumentException` when there is no entry, an entry
/// names no issuer without `isForAnyIssuer`, or one with it, an entry has neither a certificate nor
/// a path of one, a certificate is null, there is no certificate at all, since a gate would refuse
/// every token, there are signers of lists but no path of a list, and when a path is empty or
/// contains a NUL; `Tarnik::IOException` when a path does not exist or cannot be read, or the files
/// change during each of several readings; `Tarnik::Crypto::CryptoException` when a file contains
/// no certificate or list, or one that cannot be used; `Tarnik::ResourceException` when the system
/// has too few descriptors. A message names the file or the entry, by its index in `issuers`.
SSOCLIENT_ACCESS_EXPORT std::shared_ptr<TrustStore> CreateTrustStore(TrustStoreConfig config);

}  // namespace SsoClient::Access

#endif
