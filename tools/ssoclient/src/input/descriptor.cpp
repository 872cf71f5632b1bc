#include "input/descriptor.h"

#include <system_error>
#include <utility>

#include <unistd.h>

namespace SsoClient::Tool {

Descriptor::~Descriptor() {
  Close();
}

bool Descriptor::Close() noexcept {
  const int descriptor = std::exchange(descriptor_, -1);
  return descriptor < 0 || close(descriptor) == 0;
}

bool WriteAll(int descriptor, std::string_view text) {
  while (!text.empty()) {
    const ssize_t written =
        RetryInterrupted([&] { return write(descriptor, text.data(), text.size()); });
    if (written < 0) {
      return false;
    }
    text.remove_prefix(static_cast<std::size_t>(written));
  }
  return true;
}

std::string SystemMessage(int error) {
  return std::generic_category().message(error);
}

}  // namespace SsoClient::Tool
