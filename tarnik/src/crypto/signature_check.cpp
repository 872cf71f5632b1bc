#include "crypto/signature_check.h"

namespace Tarnik::Crypto {
namespace {

constexpr unsigned char kSequenceTag = 0x30;
constexpr unsigned char kIntegerTag = 0x02;
constexpr unsigned char kSignBit = 0x80;
constexpr unsigned char kOneLengthByte = 0x81;

/// Reads DER values, which are shorter than 256 bytes.
class ShortDerReader {
 public:
  ShortDerReader(const unsigned char* begin, const unsigned char* end) noexcept
      : position_(begin), end_(end) {}

  bool IsAtEnd() const noexcept { return position_ == end_; }

  /// The content of the next value; null if it has another tag, a length that is not in its
  /// shortest form, or does not fit.
  const unsigned char* Read(unsigned char tag, std::size_t& length) noexcept {
    unsigned char first = 0;
    if (!ReadByte(first) || first != tag || !ReadByte(first)) {
      return nullptr;
    }
    length = first;
    if (first >= kSignBit) {
      unsigned char next = 0;
      if (first != kOneLengthByte || !ReadByte(next) || next < kSignBit) {
        return nullptr;
      }
      length = next;
    }
    if (length > static_cast<std::size_t>(end_ - position_)) {
      return nullptr;
    }
    const unsigned char* const content = position_;
    position_ += length;
    return content;
  }

 private:
  bool ReadByte(unsigned char& byte) noexcept {
    if (IsAtEnd()) {
      return false;
    }
    byte = *position_++;
    return true;
  }

  const unsigned char* position_;
  const unsigned char* end_;
};

// X.690, section 8.3: a number has no more leading zeros than its sign needs.
bool ReadsPositiveNumber(ShortDerReader& reader, std::size_t maxLength) noexcept {
  std::size_t length = 0;
  const unsigned char* number = reader.Read(kIntegerTag, length);
  if (number == nullptr || length == 0 || number[0] >= kSignBit) {
    return false;
  }
  if (number[0] == 0) {
    return length > 1 && number[1] >= kSignBit && length - 1 <= maxLength;
  }
  return length <= maxLength;
}

bool HasFormOf(SignatureScheme scheme, const PublicKeyImpl& key,
               const std::vector<unsigned char>& signature) noexcept {
  // RFC 8017, sections 8.1.2 and 8.2.2, step 1.
  return scheme == SignatureScheme::kEcdsa ? IsEcdsaDer(signature, key.OrderLength())
                                           : signature.size() == key.ValueLength();
}

}  // namespace

bool IsEcdsaDer(const std::vector<unsigned char>& signature, std::size_t orderLength) noexcept {
  const unsigned char* begin = signature.data();
  ShortDerReader whole(begin, begin + signature.size());
  std::size_t length = 0;
  const unsigned char* content = whole.Read(kSequenceTag, length);
  if (content == nullptr || !whole.IsAtEnd()) {
    return false;
  }
  ShortDerReader numbers(content, content + length);
  const bool hasR = ReadsPositiveNumber(numbers, orderLength);
  const bool hasS = hasR && ReadsPositiveNumber(numbers, orderLength);
  return hasS && numbers.IsAtEnd();
}

bool IsSignatureOf(const PublicKeyImpl& key, SignatureScheme scheme, Hash hash,
                   const unsigned char* digest, const std::vector<unsigned char>& signature) {
  return HasFormOf(scheme, key, signature) &&
         key.Verify(scheme, hash, digest, signature.data(), signature.size());
}

}  // namespace Tarnik::Crypto
