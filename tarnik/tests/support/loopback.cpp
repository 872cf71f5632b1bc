#include "support/loopback.h"

#include <cerrno>
#include <cstddef>
#include <cstring>
#include <stdexcept>
#include <string>
#include <utility>

#include <netinet/in.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

namespace Tarnik::Testing {
namespace {

constexpr int kAcceptLimitMs = 30000;

void Require(bool condition, const char* what) {
  if (!condition) {
    throw std::runtime_error(std::string(what) + ": " + std::strerror(errno));
  }
}

int BindToLoopback(int socket, bool ipv6) {
  sockaddr_storage storage{};
  socklen_t length = sizeof(sockaddr_in);
  if (ipv6) {
    auto* address = reinterpret_cast<sockaddr_in6*>(&storage);
    address->sin6_family = AF_INET6;
    address->sin6_addr = in6addr_loopback;
    length = sizeof(sockaddr_in6);
  } else {
    auto* address = reinterpret_cast<sockaddr_in*>(&storage);
    address->sin_family = AF_INET;
    address->sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  }
  auto* address = reinterpret_cast<sockaddr*>(&storage);
  Require(bind(socket, address, length) == 0, "bind");
  Require(getsockname(socket, address, &length) == 0, "getsockname");
  return ntohs(ipv6 ? reinterpret_cast<sockaddr_in6*>(&storage)->sin6_port
                    : reinterpret_cast<sockaddr_in*>(&storage)->sin_port);
}

}  // namespace

Descriptor& Descriptor::operator=(Descriptor&& other) noexcept {
  std::swap(value_, other.value_);
  return *this;
}

void Descriptor::Close() {
  if (value_ >= 0) {
    close(value_);
  }
  value_ = -1;
}

LoopbackListener::LoopbackListener(bool ipv6, int backlog)
    : descriptor_(socket(ipv6 ? AF_INET6 : AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
  Require(descriptor_.Get() >= 0, "socket");
  port_ = BindToLoopback(descriptor_.Get(), ipv6);
  Require(listen(descriptor_.Get(), backlog) == 0, "listen");
}

Descriptor LoopbackListener::Accept() const {
  pollfd awaited{descriptor_.Get(), POLLIN, 0};
  Require(poll(&awaited, 1, kAcceptLimitMs) == 1, "waiting for a connection");
  Descriptor accepted(accept4(descriptor_.Get(), nullptr, nullptr, SOCK_CLOEXEC));
  Require(accepted.Get() >= 0, "accept");
  return accepted;
}

bool HasIpv6Loopback() {
  const Descriptor probe(socket(AF_INET6, SOCK_STREAM | SOCK_CLOEXEC, 0));
  sockaddr_in6 address{};
  address.sin6_family = AF_INET6;
  address.sin6_addr = in6addr_loopback;
  return bind(probe.Get(), reinterpret_cast<sockaddr*>(&address), sizeof(address)) == 0;
}

bool SendAll(int socket, const std::string& data) {
  std::size_t sent = 0;
  while (sent < data.size()) {
    const ssize_t result = send(socket, data.data() + sent, data.size() - sent, MSG_NOSIGNAL);
    if (result < 0) {
      return false;
    }
    sent += static_cast<std::size_t>(result);
  }
  return true;
}

std::string ReceiveExactly(int socket, std::size_t size) {
  std::string data(size, '\0');
  std::size_t received = 0;
  while (received < size) {
    const ssize_t result = recv(socket, data.data() + received, size - received, 0);
    if (result <= 0) {
      break;
    }
    received += static_cast<std::size_t>(result);
  }
  data.resize(received);
  return data;
}

void ResetOnClose(int socket) {
  const linger abort{1, 0};
  Require(setsockopt(socket, SOL_SOCKET, SO_LINGER, &abort, sizeof(abort)) == 0, "setsockopt");
}

int RefusingPort(Descriptor& holder) {
  holder = Descriptor(socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0));
  Require(holder.Get() >= 0, "socket");
  return BindToLoopback(holder.Get(), false);
}

}  // namespace Tarnik::Testing
