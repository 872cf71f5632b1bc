#include "crypto/ecdsa_value.h"

#include <tarnik/crypto/crypto_exception.h>

#include "support/openssl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

OpenSsl::OwnedBigNumber NumberFrom(const unsigned char* bytes, std::size_t length) {
  const OpenSsl::ErrorScope errors;
  OpenSsl::OwnedBigNumber number(BN_bin2bn(bytes, static_cast<int>(length), nullptr));
  if (number == nullptr) {
    throw CryptoException(errors.Describe("The ECDSA signature cannot be read"));
  }
  return number;
}

std::vector<unsigned char> Encode(const ECDSA_SIG* signature) {
  const OpenSsl::ErrorScope errors;
  unsigned char* bytes = nullptr;
  const int length = i2d_ECDSA_SIG(signature, &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  if (length <= 0) {
    throw CryptoException(errors.Describe("The ECDSA signature cannot be encoded"));
  }
  return {bytes, bytes + length};
}

}  // namespace

std::vector<unsigned char> DerFromRawEcdsa(const std::vector<unsigned char>& value,
                                           std::size_t orderLength) {
  if (value.size() % 2 != 0 || value.size() > 2 * orderLength) {
    return {};
  }
  const std::size_t half = value.size() / 2;
  OpenSsl::OwnedBigNumber r = NumberFrom(value.data(), half);
  OpenSsl::OwnedBigNumber s = NumberFrom(value.data() + half, half);
  if (BN_is_zero(r.get()) || BN_is_zero(s.get())) {
    return {};
  }
  const OpenSsl::ErrorScope errors;
  const OpenSsl::OwnedEcdsaSignature signature(ECDSA_SIG_new());
  if (signature == nullptr || ECDSA_SIG_set0(signature.get(), r.get(), s.get()) != 1) {
    throw CryptoException(errors.Describe("The ECDSA signature cannot be encoded"));
  }
  // The signature owns both numbers now.
  static_cast<void>(r.release());
  static_cast<void>(s.release());
  return Encode(signature.get());
}

std::vector<unsigned char> RawEcdsaFromDer(const std::vector<unsigned char>& der,
                                           std::size_t orderLength) {
  const OpenSsl::ErrorScope errors;
  const unsigned char* position = der.data();
  const OpenSsl::OwnedEcdsaSignature signature(
      d2i_ECDSA_SIG(nullptr, &position, static_cast<long>(der.size())));
  const int length = static_cast<int>(orderLength);
  std::vector<unsigned char> value(2 * orderLength);
  if (signature == nullptr || position != der.data() + der.size() ||
      BN_bn2binpad(ECDSA_SIG_get0_r(signature.get()), value.data(), length) != length ||
      BN_bn2binpad(ECDSA_SIG_get0_s(signature.get()), value.data() + orderLength, length) !=
          length) {
    throw CryptoException(errors.Describe("The ECDSA signature cannot be decoded"));
  }
  return value;
}

}  // namespace Tarnik::Crypto
