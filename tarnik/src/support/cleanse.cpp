#include "support/cleanse.h"

#include <cstring>

namespace Tarnik {

void CleanseBuffer(std::string& text) noexcept {
  explicit_bzero(text.data(), text.capacity());
  text.clear();
}

void CleanseBuffer(std::vector<unsigned char>& bytes) noexcept {
  if (bytes.capacity() != 0) {  // without a buffer, data() may be null
    bytes.resize(bytes.capacity());
    explicit_bzero(bytes.data(), bytes.size());
  }
  bytes.clear();
}

}  // namespace Tarnik
