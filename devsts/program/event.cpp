#include "event.h"

#include <cstdint>

#include <sys/eventfd.h>
#include <unistd.h>

#include "errors.h"

namespace DevSts::Program {

Event::Event() : descriptor_(eventfd(0, EFD_CLOEXEC)) {
  if (descriptor_.Get() < 0) {
    throw ProgramError(ExitStatus::Failed, "there are too few file descriptors");
  }
}

void Event::Set() const {
  const std::uint64_t one = 1;
  static_cast<void>(write(descriptor_.Get(), &one, sizeof one) == 0);
}

}  // namespace DevSts::Program
