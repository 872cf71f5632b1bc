#include "loopback_listener.h"

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include <stdexcept>

namespace SsoClient::Testing {

LoopbackListener::LoopbackListener() : socket_(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  if (::bind(socket_, reinterpret_cast<const sockaddr*>(&address), sizeof(address)) != 0 ||
      ::listen(socket_, 16) != 0) {
    ::close(socket_);
    throw std::runtime_error("Cannot listen on 127.0.0.1");
  }
}

LoopbackListener::~LoopbackListener() {
  ::close(socket_);
}

unsigned short LoopbackListener::Port() const {
  sockaddr_in address{};
  socklen_t size = sizeof(address);
  ::getsockname(socket_, reinterpret_cast<sockaddr*>(&address), &size);
  return ntohs(address.sin_port);
}

}  // namespace SsoClient::Testing
