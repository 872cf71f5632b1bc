#include "input/descriptor.h"

#include <system_error>

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
  return WriteAll(text, [descriptor](std::string_view rest) {
    return RetryInterrupted([&] { return write(descriptor, rest.data(), rest.size()); });
  });
}

std::string SystemMessage(int error) {
  return std::generic_category().message(error);
}

}  // namespace SsoClient::Tool
