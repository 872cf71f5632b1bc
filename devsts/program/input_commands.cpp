#include "input_commands.h"

#include <array>
#include <cerrno>
#include <utility>

#include <poll.h>
#include <unistd.h>

namespace DevSts::Program {
namespace {

constexpr std::size_t kMaxInput = 65536;

}  // namespace

InputCommands::InputCommands(std::function<bool(const std::string& line)> execute,
                             std::function<void()> ended)
    : execute_(std::move(execute)), ended_(std::move(ended)), thread_([this] {
        ReadUntilEnd();
        ended_();
      }) {}

InputCommands::~InputCommands() {
  stopped_.Set();
  thread_.join();
}

void InputCommands::ReadUntilEnd() {
  while (ReadMore() && ExecuteLines()) {
  }
}

bool InputCommands::ReadMore() {
  std::array<pollfd, 2> entries{{{STDIN_FILENO, POLLIN, 0}, {stopped_.Get(), POLLIN, 0}}};
  while (poll(entries.data(), entries.size(), -1) < 0) {
    if (errno != EINTR) {
      return false;
    }
  }
  if (entries[1].revents != 0) {
    return false;
  }
  std::array<char, 4096> octets{};
  ssize_t size = 0;
  do {
    size = read(STDIN_FILENO, octets.data(), octets.size());
  } while (size < 0 && errno == EINTR);
  if (size > 0) {
    text_.append(octets.data(), static_cast<std::size_t>(size));
  }
  return size > 0;
}

bool InputCommands::ExecuteLines() {
  for (std::size_t end = text_.find('\n'); end != std::string::npos; end = text_.find('\n')) {
    const std::string line = text_.substr(0, end);
    text_.erase(0, end + 1);
    if (!execute_(line)) {
      return false;
    }
  }
  return text_.size() <= kMaxInput;
}

}  // namespace DevSts::Program
