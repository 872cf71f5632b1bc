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

/// A private key: something that can sign and answer TLS handshakes, but not be read. It may live
/// in memory or in a device. Immutable; safe from many threads. Made by the functions below alone:
/// what uses a key accepts no other implementation.
class TARNIK_EXPORT PrivateKey : public virtual Object {
 public:
  /// The public half.
  virtual Ref<const PublicKey> GetPublicKey() const = 0;
  /// True when this is the key that `certificate` was issued for. Throws `CryptoException` when
  /// the certificate's public key is broken or of an unknown kind.
  virtual bool Matches(const Certificate& certificate) const = 0;
};

/// Gives the passphrase of an encrypted key, or the PIN of a device: at most 1024 bytes; an empty
/// one is tried like any other. It is called at most once for each load, on the thread of the load,
/// and only if there is something to decrypt or unlock; the text that it returns is overwritten
/// after use. What it throws passes through the load unchanged.
///
/// How much work a passphrase takes to be tried stands in the encrypted key itself and is not
/// limited here: keys of strangers may take very long.
using PassphraseCallback = std::function<std::string()>;

/// Reads the one private key of a PEM text (RFC 7468): PKCS#8 (RFC 5958), plain or encrypted, or
/// the traditional forms of RSA (RFC 8017, appendix A.1.2) and EC keys (RFC 5915), plain or
/// encrypted by the rules of RFC 1421. Other blocks, such as certificates, are passed over. Nobody
/// is ever asked for a passphrase but `passphrase`. `pem` stays with the caller, who may want to
/// overwrite it (`StringUtil::Cleanse`).
///
/// Throws `CryptoException` when there is no private key or more than one, when it is encrypted
/// and there is no passphrase or a wrong one, and when it is broken or of an unknown kind.
TARNIK_EXPORT Ref<const PrivateKey> CreatePrivateKeyFromPem(
    std::string_view pem, const PassphraseCallback& passphrase = {});
/// Reads a file of PEM. Throws `IOException` when it cannot be read, else as above.
TARNIK_EXPORT Ref<const PrivateKey> LoadPrivateKey(const std::string& path,
                                                   const PassphraseCallback& passphrase = {});
/// Loads the one private key that `uri` names with OpenSSL's store: "file:" (RFC 8089), or any
/// other scheme that a provider loaded into this process understands, such as "pkcs11:" (RFC 7512).
/// A key that stays in a device is used there. Throws `CryptoException` when the URI has no scheme
/// or one that nothing understands, and as above.
TARNIK_EXPORT Ref<const PrivateKey> LoadPrivateKeyFromUri(
    const std::string& uri, const PassphraseCallback& passphrase = {});

/// A private key, the certificate that was issued for it, and the other certificates that came
/// with them, in their order: usually the certificate's issuers.
struct KeyAndCertificate {
  Ref<const PrivateKey> privateKey;
  Ref<const Certificate> certificate;
  std::vector<Ref<const Certificate>> chain;
};

/// Reads a PKCS#12 (RFC 7292) with a MAC. It must hold one private key and that key's certificate.
/// The passphrase, which may not hold a NUL, is asked for unless the empty one fits. Throws
/// `CryptoException` when a key or a certificate is missing, no certificate belongs to the key,
/// there are several keys, the passphrase is wrong or there is none, there is no MAC, or the bytes
/// are broken or protected by an algorithm that is not available.
TARNIK_EXPORT KeyAndCertificate CreateKeyAndCertificateFromPkcs12(
    const unsigned char* bytes, std::size_t length, const PassphraseCallback& passphrase = {});
/// Reads a file of PKCS#12. Throws `IOException` when it cannot be read, else as above.
TARNIK_EXPORT KeyAndCertificate LoadKeyAndCertificate(const std::string& path,
                                                      const PassphraseCallback& passphrase = {});

}  // namespace Tarnik::Crypto

#endif
