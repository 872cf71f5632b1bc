#include "system/file.h"

#include <array>
#include <cerrno>
#include <cstddef>
#include <cstdio>
#include <system_error>

#include <openssl/crypto.h>

#include <tarnik/core/exception.h>

namespace Tarnik::System {
namespace {

constexpr std::size_t kMaxFileBytes = std::size_t{16} << 20;

/// A buffer whose destructor overwrites it.
struct Buffer {
  std::array<char, 4096> bytes;
  ~Buffer() { OPENSSL_cleanse(bytes.data(), bytes.size()); }
};

[[noreturn]] void ThrowUnreadable(std::string_view kind, const std::string& path,
                                  const std::string& reason) {
  throw IOException("The " + std::string(kind) + " file '" + path + "' cannot be read: " + reason +
                    ".");
}

}  // namespace

OwnedFile OpenForReading(const std::string& path) {
  return OwnedFile(std::fopen(path.c_str(), "rbe"));
}

void ReadFile(std::string_view kind, const std::string& path, SensitiveText& text) {
  if (path.find('\0') != std::string::npos) {
    throw IOException("The path of the " + std::string(kind) + " file holds a NUL.");
  }
  const OwnedFile file = OpenForReading(path);
  if (file == nullptr) {
    ThrowUnreadable(kind, path, std::generic_category().message(errno));
  }
  // Unbuffered, since the stream's own buffer would not be overwritten.
  std::setvbuf(file.get(), nullptr, _IONBF, 0);
  Buffer buffer;
  while (const std::size_t count =
             std::fread(buffer.bytes.data(), 1, buffer.bytes.size(), file.get())) {
    if (count > kMaxFileBytes - text.Size()) {
      ThrowUnreadable(kind, path, "it is longer than 16 MiB");
    }
    text.Append({buffer.bytes.data(), count});
  }
  if (std::ferror(file.get()) != 0) {
    ThrowUnreadable(kind, path, std::generic_category().message(errno));
  }
}

}  // namespace Tarnik::System
