#ifndef SSOCLIENT_TOOL_INPUT_DESCRIPTOR_H
#define SSOCLIENT_TOOL_INPUT_DESCRIPTOR_H

#include <cerrno>
#include <string>
#include <string_view>

#include <sys/types.h>

namespace SsoClient::Tool {

/// Owns a file descriptor; negative for none.
class Descriptor {
 public:
  explicit Descriptor(int descriptor) noexcept : descriptor_(descriptor) {}
  ~Descriptor();
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;

  int Get() const noexcept { return descriptor_; }
  /// Closes it. False, with `errno`, when that fails, which may be the first report of a failed
  /// write.
  bool Close() noexcept;

 private:
  int descriptor_;
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

/// Writes all of `text`. False, with `errno`, when that fails.
bool WriteAll(int descriptor, std::string_view text);

/// The system's text for an error number.
std::string SystemMessage(int error);

}  // namespace SsoClient::Tool

#endif
