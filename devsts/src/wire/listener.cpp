#include "wire/listener.h"

#include <cerrno>
#include <memory>
#include <stdexcept>
#include <system_error>

#include <netdb.h>
#include <netinet/in.h>
#include <netinet/tcp.h>
#include <sys/socket.h>
#include <unistd.h>

#include "signing/openssl_handles.h"
#include "wire/accept.h"

namespace DevSts {
namespace {

using AddressHandle = std::unique_ptr<addrinfo, FreeWith<freeaddrinfo>>;

AddressHandle Resolve(const std::string& address, std::uint16_t port) {
  addrinfo hints{};
  hints.ai_flags = AI_NUMERICHOST | AI_NUMERICSERV;
  hints.ai_socktype = SOCK_STREAM;
  addrinfo* found = nullptr;
  if (getaddrinfo(address.c_str(), std::to_string(port).c_str(), &hints, &found) != 0) {
    throw std::runtime_error("not a numeric address: " + address);
  }
  return AddressHandle(found);
}

[[noreturn]] void ThrowSystemError(int socket, const char* what) {
  const std::error_code code(errno, std::generic_category());
  close(socket);
  throw std::system_error(code, what);
}

std::uint16_t PortOf(int socket) {
  sockaddr_storage address{};
  socklen_t size = sizeof address;
  if (getsockname(socket, reinterpret_cast<sockaddr*>(&address), &size) != 0) {
    ThrowSystemError(socket, "getsockname");
  }
  if (address.ss_family == AF_INET6) {
    return ntohs(reinterpret_cast<const sockaddr_in6*>(&address)->sin6_port);
  }
  return ntohs(reinterpret_cast<const sockaddr_in*>(&address)->sin_port);
}

int Listen(const addrinfo& address) {
  const int made = socket(address.ai_family, SOCK_STREAM | SOCK_CLOEXEC, 0);
  if (made < 0) {
    throw std::system_error(errno, std::generic_category(), "socket");
  }
  const int on = 1;
  setsockopt(made, SOL_SOCKET, SO_REUSEADDR, &on, sizeof on);
  if (bind(made, address.ai_addr, address.ai_addrlen) != 0) {
    ThrowSystemError(made, "bind");
  }
  if (listen(made, SOMAXCONN) != 0) {
    ThrowSystemError(made, "listen");
  }
  return made;
}

}  // namespace

Listener::Listener(const std::string& address, std::uint16_t port, std::function<void(int)> accept,
                   std::function<void(const std::string&)> failed)
    : socket_(Listen(*Resolve(address, port))),
      port_(PortOf(socket_)),
      accept_(std::move(accept)),
      failed_(std::move(failed)) {
  try {
    thread_ = std::thread([this] { Accept(); });
  } catch (...) {
    close(socket_);
    throw;
  }
}

Listener::~Listener() {
  stopped_ = true;
  shutdown(socket_, SHUT_RDWR);  // ends accept() in the thread
  thread_.join();
  close(socket_);
}

void Listener::Accept() {
  const int error = AcceptUntilStopped(socket_, stopped_, [this](int accepted) {
    const int on = 1;
    setsockopt(accepted, IPPROTO_TCP, TCP_NODELAY, &on, sizeof on);
    accept_(accepted);
  });
  if (error != 0) {
    failed_("port " + std::to_string(port_) +
            " accepts no more connections: " + std::generic_category().message(error));
  }
}

}  // namespace DevSts
