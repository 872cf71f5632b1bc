#include "support/dead_listener.h"

#include <stdexcept>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>

namespace Tarnik::Testing {

DeadListener::DeadListener() {
  constexpr int kMaxFillers = 20;
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  address.sin_port = htons(static_cast<in_port_t>(listener_.Port()));
  while (fillers_.size() < kMaxFillers) {
    fillers_.emplace_back(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC | SOCK_NONBLOCK, 0));
    const int filler = fillers_.back().Get();
    connect(filler, reinterpret_cast<const sockaddr*>(&address), sizeof(address));
    // The kernel answers on the loopback interface within the call, or not at all.
    pollfd awaited{filler, POLLOUT, 0};
    if (poll(&awaited, 1, 0) == 0) {
      return;
    }
  }
  throw std::runtime_error("the backlog never filled up");
}

}  // namespace Tarnik::Testing
