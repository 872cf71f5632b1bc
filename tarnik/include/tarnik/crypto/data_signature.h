#ifndef TARNIK_CRYPTO_DATA_SIGNATURE_H
#define TARNIK_CRYPTO_DATA_SIGNATURE_H

#include <string_view>
#include <vector>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>

namespace Tarnik::Crypto {

/// A signature algorithm with its hash. There are no others.
enum class SignatureAlgorithm {
  kRsaPkcs1Sha256,  ///< RSASSA-PKCS1-v1_5 (RFC 8017, section 8.2)
  kRsaPkcs1Sha384,  ///< the same with SHA-384
  kRsaPkcs1Sha512,  ///< the same with SHA-512
  kRsaPssSha256,  ///< RSASSA-PSS (RFC 8017, section 8.1); MGF1 with the same hash, whose length the
                  ///< salt has
  kRsaPssSha384,  ///< the same with SHA-384
  kRsaPssSha512,  ///< the same with SHA-512
  kEcdsaSha256,   ///< ECDSA (FIPS 186-5, section 6) on P-256, P-384 or P-521
  kEcdsaSha384,   ///< the same with SHA-384
  kEcdsaSha512,   ///< the same with SHA-512
};

/// True when `signature` is a signature of `data` that was made with the private key of
/// `certificate`. An ECDSA signature is in the form of RFC 3279, section 2.2.3, in DER. False for
/// every other signature, also for one of a wrong length or form. Only the key of the certificate
/// is used: whether the certificate is trusted and valid is for the caller to check. Safe from many
/// threads.
///
/// Throws `CryptoException` when the key is not of the algorithm's type (RSA-PSS accepts keys for
/// RSA and keys for RSA-PSS only), is an RSA key of fewer than 2048 bits or an EC key on another
/// curve, is restricted to other parameters or cannot be decoded, and when OpenSSL fails. Throws
/// `InvalidArgumentException` when `algorithm` is not one of the above.
TARNIK_EXPORT bool VerifyData(const Certificate& certificate, SignatureAlgorithm algorithm,
                              std::string_view data, const std::vector<unsigned char>& signature);

/// Signs `data`. With the certificate of `privateKey`, `VerifyData` accepts the result. Throws
/// `CryptoException` as above, and when the operation or the device of the key fails;
/// `InvalidArgumentException` also when the key was not created by this library.
TARNIK_EXPORT std::vector<unsigned char> SignData(const PrivateKey& privateKey,
                                                  SignatureAlgorithm algorithm,
                                                  std::string_view data);

}  // namespace Tarnik::Crypto

#endif
