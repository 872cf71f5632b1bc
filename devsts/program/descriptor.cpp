#include "descriptor.h"

#include <cerrno>
#include <utility>

#include <fcntl.h>
#include <unistd.h>

namespace DevSts::Program {

Descriptor::~Descriptor() {
  if (number_ >= 0) {
    close(number_);
  }
}

Descriptor::Descriptor(Descriptor&& other) noexcept : number_(std::exchange(other.number_, -1)) {}

Descriptor& Descriptor::operator=(Descriptor&& other) noexcept {
  std::swap(number_, other.number_);
  return *this;
}

void OpenStandardStreams() {
  for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
    if (fcntl(stream, F_GETFD) < 0) {
      static_cast<void>(open("/dev/null", O_RDWR));  // takes the lowest number, which is this one
    }
  }
}

void WriteToDescriptor(int descriptor, const std::string& text) {
  for (std::size_t at = 0; at < text.size();) {
    const ssize_t size = write(descriptor, text.data() + at, text.size() - at);
    if (size < 0 && errno == EINTR) {
      continue;
    }
    if (size <= 0) {
      return;
    }
    at += static_cast<std::size_t>(size);
  }
}

}  // namespace DevSts::Program
