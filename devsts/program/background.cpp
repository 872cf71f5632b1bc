#include "background.h"

#include <array>
#include <cerrno>
#include <limits>

#include <fcntl.h>
#include <sys/wait.h>
#include <unistd.h>

#include "descriptor.h"
#include "errors.h"

namespace DevSts::Program {
namespace {

void LeaveStandardStreams() {
  const Descriptor null(open("/dev/null", O_RDWR | O_CLOEXEC));
  for (const int stream : {STDIN_FILENO, STDOUT_FILENO, STDERR_FILENO}) {
    dup2(null.Get(), stream);
  }
}

// Waits until the process is ready or has ended.
int AwaitReady(int pipe, pid_t process) {
  char octet = 0;
  ssize_t size = 0;
  do {
    size = read(pipe, &octet, 1);
  } while (size < 0 && errno == EINTR);
  if (size == 1) {
    return static_cast<int>(ExitStatus::Ended);
  }
  int status = 0;
  while (waitpid(process, &status, 0) < 0 && errno == EINTR) {
  }
  return WIFEXITED(status) ? WEXITSTATUS(status) : static_cast<int>(ExitStatus::Failed);
}

}  // namespace

int RunInBackground(const std::function<int(const std::function<void()>& ready)>& run) {
  // The service must not keep other files of its starter open, such as pipes that are read to their
  // ends.
  close_range(STDERR_FILENO + 1, std::numeric_limits<unsigned>::max(), 0);
  std::array<int, 2> ends{};
  if (pipe2(ends.data(), O_CLOEXEC) != 0) {
    throw ProgramError(ExitStatus::Failed, "a pipe cannot be made");
  }
  Descriptor reader(ends[0]);
  Descriptor writer(ends[1]);
  const pid_t process = fork();
  if (process < 0) {
    throw ProgramError(ExitStatus::Failed, "a process cannot be started");
  }
  if (process > 0) {
    writer = Descriptor();
    return AwaitReady(reader.Get(), process);
  }
  reader = Descriptor();
  setsid();
  return run([&] {
    LeaveStandardStreams();
    // The starter has ended if nobody reads.
    if (write(writer.Get(), "r", 1) != 1) {
      throw ProgramError(ExitStatus::Failed, "the starter has ended");
    }
    writer = Descriptor();
  });
}

}  // namespace DevSts::Program
