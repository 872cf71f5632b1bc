#include "control_client.h"

#include <algorithm>
#include <array>
#include <cerrno>
#include <cstring>
#include <iostream>
#include <stdexcept>

#include <poll.h>
#include <sys/syscall.h>
#include <unistd.h>

#include "command_line.h"
#include "control_socket.h"
#include "errors.h"

namespace DevSts::Program {
namespace {

Descriptor ConnectTo(const std::string& path) {
  const sockaddr_un address = AddressOf(path);
  Descriptor connection(socket(AF_UNIX, SOCK_STREAM | SOCK_CLOEXEC, 0));
  if (connect(connection.Get(), reinterpret_cast<const sockaddr*>(&address), sizeof address) != 0) {
    throw std::runtime_error(path + ": no service listens: " + std::strerror(errno));
  }
  return connection;
}

std::string ReadLine(int connection) {
  std::array<char, 4096> octets{};
  std::string text;
  for (;;) {
    const ssize_t size = recv(connection, octets.data(), octets.size(), 0);
    if (size <= 0) {
      throw std::runtime_error("the service did not answer");
    }
    text.append(octets.data(), static_cast<std::size_t>(size));
    const std::size_t end = text.find('\n');
    if (end != std::string::npos) {
      return text.substr(0, end);
    }
  }
}

// The process at the other end; holds no descriptor if the system does not say which it is.
Descriptor ServiceOf(int connection) {
  ucred peer{};
  socklen_t size = sizeof peer;
  if (getsockopt(connection, SOL_SOCKET, SO_PEERCRED, &peer, &size) != 0 || peer.pid <= 0) {
    return Descriptor();
  }
  return Descriptor(static_cast<int>(syscall(SYS_pidfd_open, peer.pid, 0)));
}

// After it, the service's folder, socket and ports are free.
void AwaitEnd(const Descriptor& service) {
  constexpr int kMilliseconds = 60000;
  pollfd ended{service.Get(), POLLIN, 0};
  if (service.Get() >= 0 && poll(&ended, 1, kMilliseconds) == 0) {
    throw std::runtime_error("the service has not ended after 60 s");
  }
}

}  // namespace

int RunControlClient(const std::string& path, const std::vector<std::string>& command) {
  try {
    const std::string line = LineOf(command);
    const Descriptor connection = ConnectTo(path);
    const Descriptor service = ServiceOf(connection.Get());
    SendLine(connection.Get(), line);
    const std::string answer = ReadLine(connection.Get());
    const std::size_t space = std::min(answer.find(' '), answer.size() - 1);
    const std::string text = answer.substr(space + 1);
    if (answer.substr(0, space) == "ok") {
      if (command.front() == "quit") {
        AwaitEnd(service);
      }
      std::cout << text << std::endl;
      return 0;
    }
    std::cerr << "ssoclient-devsts: " << text << '\n';
  } catch (const std::exception& error) {
    std::cerr << "ssoclient-devsts: " << error.what() << '\n';
  }
  return 1;
}

}  // namespace DevSts::Program
