#include <array>
#include <string>
#include <string_view>
#include <utility>

#include <openssl/ecerr.h>
#include <openssl/err.h>
#include <openssl/rsaerr.h>

#include <tarnik/crypto/crypto_exception.h>

#include "crypto/public_key_impl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

KeyAlgorithm AlgorithmOf(const EVP_PKEY* key) noexcept {
  switch (EVP_PKEY_get_base_id(key)) {
    case EVP_PKEY_RSA:
      return KeyAlgorithm::kRsa;
    case EVP_PKEY_RSA_PSS:
      return KeyAlgorithm::kRsaPss;
    case EVP_PKEY_EC:
      return KeyAlgorithm::kEc;
    default:
      return KeyAlgorithm::kOther;
  }
}

Curve CurveOf(const EVP_PKEY* key) noexcept {
  std::array<char, 32> buffer{};
  std::size_t length = 0;
  if (EVP_PKEY_get_group_name(key, buffer.data(), buffer.size(), &length) != 1) {
    return Curve::kNone;
  }
  const std::string_view name(buffer.data(), length);
  if (name == SN_X9_62_prime256v1) {
    return Curve::kP256;
  }
  if (name == SN_secp384r1) {
    return Curve::kP384;
  }
  return name == SN_secp521r1 ? Curve::kP521 : Curve::kNone;
}

// What OpenSSL reports of an RSA signature whose value is that of another message or key (RFC 8017,
// sections 8.1.2 and 8.2.2).
bool IsRsaMismatch(unsigned long error) noexcept {
  if (ERR_GET_LIB(error) != ERR_LIB_RSA) {
    return false;
  }
  switch (ERR_GET_REASON(error)) {
    case RSA_R_BAD_FIXED_HEADER_DECRYPT:
    case RSA_R_BAD_PAD_BYTE_COUNT:
    case RSA_R_BAD_SIGNATURE:
    case RSA_R_BLOCK_TYPE_IS_NOT_01:
    case RSA_R_DATA_TOO_LARGE:
    case RSA_R_DATA_TOO_LARGE_FOR_MODULUS:
    case RSA_R_FIRST_OCTET_INVALID:
    case RSA_R_INVALID_PADDING:
    case RSA_R_LAST_OCTET_INVALID:
    case RSA_R_NULL_BEFORE_BLOCK_MISSING:
    case RSA_R_PADDING_CHECK_FAILED:
    case RSA_R_SLEN_CHECK_FAILED:
    case RSA_R_SLEN_RECOVERY_FAILED:
    case RSA_R_WRONG_SIGNATURE_LENGTH:
      return true;
    default:
      return false;
  }
}

// What OpenSSL reports besides the result 0 of an ECDSA signature that does not match: nothing, an
// error if its numbers are out of range, or, from version 3.4 on, only that it does not match.
bool IsEcdsaMismatch(unsigned long error) noexcept {
#ifdef EVP_R_PROVIDER_SIGNATURE_FAILURE
  if (ERR_GET_LIB(error) == ERR_LIB_EVP &&
      ERR_GET_REASON(error) == EVP_R_PROVIDER_SIGNATURE_FAILURE) {
    return true;
  }
#endif
  return error == 0 ||
         (ERR_GET_LIB(error) == ERR_LIB_EC && ERR_GET_REASON(error) == EC_R_BAD_SIGNATURE);
}

bool IsMismatch(int result, SignatureScheme scheme, unsigned long error) noexcept {
  return scheme == SignatureScheme::kEcdsa ? result == 0 && IsEcdsaMismatch(error)
                                           : IsRsaMismatch(error);
}

// A failure of OpenSSL says nothing about the signature.
void RequireMismatch(int result, SignatureScheme scheme, const OpenSsl::ErrorReport& report) {
  if (report.isOutOfMemory) {
    throw CryptoException("There is not enough memory to verify the signature.");
  }
  if (!IsMismatch(result, scheme, report.cause)) {
    const char* reason = report.cause == 0 ? nullptr : OpenSsl::ReasonOf(report.cause);
    throw CryptoException(std::string("The cryptographic library cannot verify the signature") +
                          (reason == nullptr ? "." : std::string(": ") + reason + "."));
  }
}

}  // namespace

PublicKeyImpl::PublicKeyImpl(OpenSsl::OwnedKey key)
    : key_(std::move(key)),
      algorithm_(AlgorithmOf(key_.get())),
      bits_(EVP_PKEY_get_bits(key_.get())),
      valueLength_(static_cast<std::size_t>(EVP_PKEY_get_size(key_.get()))) {
  if (algorithm_ == KeyAlgorithm::kEc) {
    const OpenSsl::ErrorScope errors;
    curve_ = CurveOf(key_.get());
  }
}

PublicKeyImpl::~PublicKeyImpl() = default;

bool PublicKeyImpl::Verify(SignatureScheme scheme, Hash hash, const unsigned char* digest,
                           const unsigned char* signature, std::size_t signatureLength) const {
  const OpenSsl::FreshErrors errors;
  OpenSsl::OwnedKeyContext context = contexts_.Take(key_.get(), scheme, hash);
  const int result =
      EVP_PKEY_verify(context.get(), signature, signatureLength, digest, HashLength(hash));
  if (result == 1) {
    contexts_.Keep(scheme, hash, std::move(context));
    return true;
  }
  RequireMismatch(result, scheme, errors.Take());
  return false;
}

}  // namespace Tarnik::Crypto
