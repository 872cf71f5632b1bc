#ifndef TARNIK_CRYPTO_DER_WRITER_H
#define TARNIK_CRYPTO_DER_WRITER_H

#include <cstddef>
#include <string>
#include <string_view>

namespace Tarnik::Crypto {

/// Tags of X.690, section 8.
enum class DerTag : unsigned char {
  kInteger = 0x02,
  kBitString = 0x03,
  kObjectIdentifier = 0x06,
  kUtf8String = 0x0C,
  kSequence = 0x30,
  kSet = 0x31,
};

/// One value in DER (X.690, section 8.1): tag, length and `content`.
std::string DerOf(DerTag tag, std::string_view content);
/// The unsigned number that `bytes` are in big-endian order.
std::string DerOfNumber(std::string_view bytes);
/// A bit string of whole bytes.
std::string DerOfBits(std::string_view bytes);

}  // namespace Tarnik::Crypto

#endif
