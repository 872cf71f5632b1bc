#ifndef TARNIK_CRYPTO_PRIVATE_KEY_H
#define TARNIK_CRYPTO_PRIVATE_KEY_H

#include <cstddef>
#include <functional>
#include <string>
#include <string_view>
#include <vector>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/public_key.h>

namespace Tarnik::Crypto {

/// A private key, which can sign and be used in TLS handshakes but not be read. It may be in memory
/// or in a device. Immutable; thread-safe. Created only by the functions below: functions that use
/// a key accept no other implementation.
class TARNIK_EXPORT PrivateKey : public virtual Object {
 public:
  /// The public half.
  virtual Ref<const PublicKey> GetPublicKey() const = 0;
  /// True when `certificate` was issued for this key. Throws `CryptoException` when
  /// the certificate's public key cannot be decoded or is of an unknown kind.
  virtual bool Matches(const Certificate& certificate) const = 0;
};

/// Returns the passphrase of an encrypted key, or the PIN of a device: at most 1024 bytes; an empty
/// one is tried like any other. It is called at most once for each load, on the thread of the load,
/// and only if there is something to decrypt or unlock; the returned text is overwritten after use.
/// Its exceptions pass through the load unchanged.
///
/// The encrypted key itself defines how much work it takes to try a passphrase. This is not
/// limited: a key from an untrusted source may take very long.
using PassphraseCallback = std::function<std::string()>;

/// Reads the only private key of a PEM text (RFC 7468): PKCS#8 (RFC 5958), plain or encrypted, or
/// the traditional forms of RSA (RFC 8017, appendix A.1.2) and EC keys (RFC 5915), plain or
/// encrypted as in RFC 1421. Other blocks, such as certificates, are skipped. Passphrases are
/// requested only from `passphrase`, never from a terminal. The caller keeps `pem` and may want to
/// overwrite it (`StringUtil::Cleanse`).
///
/// Throws `CryptoException` when there is no private key or more than one, when it is encrypted
/// and there is no passphrase or a wrong one, and when it cannot be decoded or is of an unknown
/// kind.
TARNIK_EXPORT Ref<const PrivateKey> CreatePrivateKeyFromPem(
    std::string_view pem, const PassphraseCallback& passphrase = {});
/// Reads a PEM file. Throws `IOException` when it cannot be read, and otherwise as above.
TARNIK_EXPORT Ref<const PrivateKey> LoadPrivateKey(const std::string& path,
                                                   const PassphraseCallback& passphrase = {});
/// Loads the only private key that `uri` names, through OpenSSL's store: "file:" (RFC 8089) with
/// the path of a file of this machine, or another scheme that a provider loaded into this process
/// supports, such as "pkcs11:" (RFC 7512). A key in a device stays there. Throws `CryptoException`
/// when the URI has no scheme or an unsupported one, when the file cannot be read or is a folder,
/// and as above; also when another scheme's URI is at the same time the path of a file, which
/// OpenSSL would prefer.
TARNIK_EXPORT Ref<const PrivateKey> LoadPrivateKeyFromUri(
    const std::string& uri, const PassphraseCallback& passphrase = {});

/// A private key, the certificate that was issued for it, and the other certificates of the same
/// source in their order: usually the certificate's issuers.
struct KeyAndCertificate {
  Ref<const PrivateKey> privateKey;           ///< never null
  Ref<const Certificate> certificate;         ///< never null
  std::vector<Ref<const Certificate>> chain;  ///< may be empty
};

/// Reads a PKCS#12 (RFC 7292) with a MAC. It must contain one private key and that key's
/// certificate. The passphrase, which must not contain a NUL, is requested unless the empty one is
/// correct. Throws `CryptoException` when a key or a certificate is missing, no certificate belongs
/// to the key, there are several keys, the passphrase is wrong or missing, there is no MAC, or the
/// bytes cannot be decoded or are protected with an algorithm that is not available.
TARNIK_EXPORT KeyAndCertificate CreateKeyAndCertificateFromPkcs12(
    const unsigned char* bytes, std::size_t length, const PassphraseCallback& passphrase = {});
/// Reads a PKCS#12 file. Throws `IOException` when it cannot be read, and otherwise as above.
TARNIK_EXPORT KeyAndCertificate LoadKeyAndCertificate(const std::string& path,
                                                      const PassphraseCallback& passphrase = {});

}  // namespace Tarnik::Crypto

#endif
