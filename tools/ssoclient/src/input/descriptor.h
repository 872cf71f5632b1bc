#ifndef SSOCLIENT_TOOL_INPUT_DESCRIPTOR_H
#define SSOCLIENT_TOOL_INPUT_DESCRIPTOR_H

#include <cerrno>
#include <cstddef>
#include <string>
#include <string_view>
#include <utility>

#include <sys/types.h>

namespace SsoClient::Tool {

/// Owns a file descriptor; negative for none.
class Descriptor {
 public:
  Descriptor() = default;
  explicit Descriptor(int descriptor) noexcept : descriptor_(descriptor) {}
  Descriptor(Descriptor&& other) noexcept : descriptor_(std::exchange(other.descriptor_, -1)) {}
  Descriptor& operator=(Descriptor&& other) noexcept {
    std::swap(descriptor_, other.descriptor_);
    return *this;
  }
  ~Descriptor();

  int Get() const noexcept { return descriptor_; }
  /// Closes it. False, with `errno`, when that fails, which may be the first report of a failed
  /// write.
  bool Close() noexcept;

 private:
  int descriptor_ = -1;
};

/// Calls `call` until no signal interrupts it.
template <class Call>
ssize_t RetryInterrupted(Call call) {
  ssize_t result = call();
  while (result < 0 && errno == EINTR) {
    result = call();
  }
  return result;
}

/// Passes what is left of `text` to `writeSome` until that has taken all. `writeSome` returns how
/// many bytes it has taken; false when that is negative.
template <class WriteSome>
bool WriteAll(std::string_view text, WriteSome writeSome) {
  while (!text.empty()) {
    const ssize_t written = writeSome(text);
    if (written < 0) {
      return false;
    }
    text.remove_prefix(static_cast<std::size_t>(written));
  }
  return true;
}

/// Writes all of `text`. False, with `errno`, when that fails.
bool WriteAll(int descriptor, std::string_view text);

/// The system's text for an error number.
std::string SystemMessage(int error);

}  // namespace SsoClient::Tool

#endif
