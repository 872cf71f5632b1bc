#include <algorithm>
#include <cstring>
#include <limits>
#include <string>

#include <openssl/evp.h>

#include <tarnik/core/exception.h>
#include <tarnik/text/base64.h>

namespace Tarnik {
namespace {

// OpenSSL takes lengths as int, so long inputs are encoded in pieces of whole groups.
constexpr std::size_t kPieceBytes = std::size_t{3} << 20;
constexpr std::size_t kMaxGroups = std::numeric_limits<std::size_t>::max() / 4;

std::size_t EncodeBlock(const unsigned char* data, std::size_t length, char* buffer) {
  return static_cast<std::size_t>(
      EVP_EncodeBlock(reinterpret_cast<unsigned char*>(buffer), data, static_cast<int>(length)));
}

}  // namespace

std::size_t Base64_EncodedLength(const unsigned char* data, std::size_t length) {
  if (data == nullptr && length != 0) {
    throw InvalidArgumentException("There are no bytes to encode in Base64.");
  }
  const std::size_t groups = length / 3 + (length % 3 == 0 ? 0 : 1);
  if (groups > kMaxGroups) {
    throw InvalidArgumentException("The bytes are too many for a Base64 text.");
  }
  return groups * 4;
}

void Base64_Encode(const unsigned char* data, std::size_t length, char* buffer,
                   std::size_t bufferSize, std::size_t* written) {
  const std::size_t needed = Base64_EncodedLength(data, length);
  if (written == nullptr || (buffer == nullptr && length != 0) || bufferSize < needed) {
    throw InvalidArgumentException("There is no room for a Base64 text of " +
                                   std::to_string(needed) + " characters.");
  }
  *written = needed;
  if (length == 0) {
    return;
  }
  // OpenSSL appends a NUL, for which the buffer may have no room: the last group is encoded into
  // another buffer.
  const std::size_t head = (length - 1) / 3 * 3;
  for (std::size_t from = 0; from < head; from += kPieceBytes) {
    buffer += EncodeBlock(data + from, std::min(kPieceBytes, head - from), buffer);
  }
  char lastGroup[5];
  EncodeBlock(data + head, length - head, lastGroup);
  std::memcpy(buffer, lastGroup, 4);
}

}  // namespace Tarnik
