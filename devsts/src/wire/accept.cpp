#include "wire/accept.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <chrono>

#include <poll.h>
#include <sys/socket.h>

namespace DevSts {
namespace {

constexpr std::chrono::milliseconds kPause{50};

// Errors of a connection that has left the queue; accept() on Linux also reports its network
// errors.
bool ConcernsOneConnection(int error) {
  constexpr std::array<int, 11> kErrors{EINTR,       ECONNABORTED, EPROTO,    ENETDOWN,
                                        ENOPROTOOPT, EHOSTDOWN,    ENONET,    EHOSTUNREACH,
                                        ENETUNREACH, ETIMEDOUT,    EOPNOTSUPP};
  return std::find(kErrors.begin(), kErrors.end(), error) != kErrors.end();
}

bool ConcernsListener(int error) {
  return error == EBADF || error == EINVAL || error == ENOTSOCK || error == EFAULT;
}

// Returns false if the listener has been shut down. Needs no descriptor.
bool Pause(int listener) {
  pollfd entry{listener, 0, 0};
  return poll(&entry, 1, static_cast<int>(kPause.count())) <= 0;
}

}  // namespace

int AcceptUntilStopped(int listener, const std::atomic<bool>& stopped,
                       const std::function<void(int socket)>& take) {
  while (!stopped) {
    const int accepted = accept4(listener, nullptr, nullptr, SOCK_CLOEXEC);
    const int error = errno;
    if (accepted >= 0) {
      take(accepted);
    } else if (ConcernsListener(error) || (!ConcernsOneConnection(error) && !Pause(listener))) {
      return stopped ? 0 : error;
    }
  }
  return 0;
}

}  // namespace DevSts
