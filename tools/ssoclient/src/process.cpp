#include "process.h"

#include <cerrno>
#include <csignal>
#include <cstdlib>
#include <ostream>

#include <fcntl.h>
#include <sys/prctl.h>
#include <unistd.h>

#include "input/descriptor.h"
#include "service/service_call.h"

namespace SsoClient::Tool {
namespace {

// The other way round, so that reading or writing still fails.
int OppositeMode(int descriptor) {
  return descriptor == STDIN_FILENO ? O_WRONLY : O_RDONLY;
}

void OccupyStandardStreams() {
  for (int descriptor = STDIN_FILENO; descriptor <= STDERR_FILENO; ++descriptor) {
    if (fcntl(descriptor, F_GETFD) < 0) {
      // The lowest free descriptor is this one, since those below are in use.
      open("/dev/null", OppositeMode(descriptor));
    }
  }
}

}  // namespace

void PrepareProcess() {
  OccupyStandardStreams();
  std::signal(SIGPIPE, SIG_IGN);
  std::signal(SIGXFSZ, SIG_IGN);
  // RLIMIT_CORE would not be enough: it does not hold for dumps that the system passes to a program
  // (/proc/sys/kernel/core_pattern).
  prctl(PR_SET_DUMPABLE, 0);
}

ExitStatus FinishOutput(const Console& console, ExitStatus status) {
  errno = 0;
  console.out.flush();
  const int error = errno;
  console.err.flush();
  if (console.out || status != ExitStatus::kDone) {
    return status;
  }
  console.err << console.PaintError(Colour::kBad, "ssoclient: ")
              << "cannot write to standard output"
              << (error == 0 ? std::string() : ": " + SystemMessage(error)) << '\n'
              << std::flush;
  return ExitStatus::kLocal;
}

void EndProcess(ExitStatus status) {
  if (IsCallAbandoned()) {
    std::_Exit(static_cast<int>(status));
  }
  std::exit(static_cast<int>(status));
}

}  // namespace SsoClient::Tool
