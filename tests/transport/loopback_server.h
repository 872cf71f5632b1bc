#ifndef SSOCLIENT_TESTS_TRANSPORT_LOOPBACK_SERVER_H
#define SSOCLIENT_TESTS_TRANSPORT_LOOPBACK_SERVER_H

#include <cstddef>
#include <cstring>
#include <functional>
#include <mutex>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <arpa/inet.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

namespace SsoClient::Testing {

/// An IPv4 loopback socket on a port that the system chooses.
class LoopbackSocket {
 public:
  LoopbackSocket() : fd_(::socket(AF_INET, SOCK_STREAM | SOCK_CLOEXEC, 0)) {
    sockaddr_in address = {};
    address.sin_family = AF_INET;
    address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
    socklen_t length = sizeof(address);
    auto* generic = static_cast<sockaddr*>(static_cast<void*>(&address));
    if (fd_ < 0 || ::bind(fd_, generic, length) != 0 || ::getsockname(fd_, generic, &length) != 0) {
      throw std::runtime_error(std::strerror(errno));
    }
    port_ = ntohs(address.sin_port);
  }
  LoopbackSocket(const LoopbackSocket&) = delete;
  LoopbackSocket& operator=(const LoopbackSocket&) = delete;
  ~LoopbackSocket() { ::close(fd_); }

  int Descriptor() const { return fd_; }
  int Port() const { return port_; }

 private:
  int fd_;
  int port_ = 0;
};

/// A listener whose queue is full: another connect neither succeeds nor fails.
class FullListener {
 public:
  FullListener() {
    ::listen(listener_.Descriptor(), 0);
    for (int i = 0; i < 4; ++i) {
      fillers_.push_back(::socket(AF_INET, SOCK_STREAM | SOCK_NONBLOCK, 0));
      sockaddr_in address = {};
      address.sin_family = AF_INET;
      address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
      address.sin_port = htons(static_cast<in_port_t>(listener_.Port()));
      ::connect(fillers_.back(), static_cast<sockaddr*>(static_cast<void*>(&address)),
                sizeof(address));
    }
  }
  FullListener(const FullListener&) = delete;
  FullListener& operator=(const FullListener&) = delete;
  ~FullListener() {
    for (const int fd : fillers_) {
      ::close(fd);
    }
  }
  int Port() const { return listener_.Port(); }

 private:
  LoopbackSocket listener_;
  std::vector<int> fillers_;
};

/// The body of an HTTP message.
inline std::string BodyOf(const std::string& message) {
  return message.substr(message.find("\r\n\r\n") + 4);
}

/// A plain HTTP server on the loopback address that answers each complete request with exactly the
/// bytes that `answer` returns.
class LoopbackServer {
 public:
  using Answer = std::function<std::string(const std::string& request)>;

  explicit LoopbackServer(Answer answer) : answer_(std::move(answer)) {
    if (::listen(socket_.Descriptor(), 16) != 0) {
      throw std::runtime_error(std::strerror(errno));
    }
    acceptor_ = std::thread([this] { Accept(); });
  }

  LoopbackServer(const LoopbackServer&) = delete;
  LoopbackServer& operator=(const LoopbackServer&) = delete;

  ~LoopbackServer() {
    ::shutdown(socket_.Descriptor(), SHUT_RDWR);
    acceptor_.join();
    {
      const std::lock_guard<std::mutex> guard(mutex_);
      for (const int fd : connections_) {
        ::shutdown(fd, SHUT_RDWR);
      }
    }
    for (auto& thread : threads_) {
      thread.join();
    }
    for (const int fd : connections_) {
      ::close(fd);
    }
  }

  int Port() const { return socket_.Port(); }
  std::string Url(const std::string& target) const {
    return "http://127.0.0.1:" + std::to_string(Port()) + target;
  }

  std::vector<std::string> Requests() const {
    const std::lock_guard<std::mutex> guard(mutex_);
    return requests_;
  }

 private:
  void Accept() {
    for (;;) {
      const int fd = ::accept(socket_.Descriptor(), nullptr, nullptr);
      if (fd < 0) {
        return;
      }
      const std::lock_guard<std::mutex> guard(mutex_);
      connections_.push_back(fd);
      threads_.emplace_back([this, fd] { Serve(fd); });
    }
  }

  void Serve(int fd) {
    std::string received;
    char buffer[4096];
    for (;;) {
      const ssize_t count = ::recv(fd, buffer, sizeof(buffer), 0);
      if (count <= 0) {
        return;
      }
      received.append(buffer, static_cast<std::size_t>(count));
      const std::size_t length = WholeRequestLength(received);
      if (length == 0) {
        continue;
      }
      const std::string request = received.substr(0, length);
      received.erase(0, length);
      {
        const std::lock_guard<std::mutex> guard(mutex_);
        requests_.push_back(request);
      }
      const std::string answer = answer_(request);
      if (answer.empty()) {
        continue;  // let the client wait
      }
      ::send(fd, answer.data(), answer.size(), MSG_NOSIGNAL);
    }
  }

  static std::size_t WholeRequestLength(const std::string& received) {
    const auto headEnd = received.find("\r\n\r\n");
    if (headEnd == std::string::npos) {
      return 0;
    }
    const auto field = received.find("Content-Length: ");
    const std::size_t bodyLength =
        field < headEnd ? std::stoul(received.substr(field + std::strlen("Content-Length: "))) : 0;
    const std::size_t length = headEnd + 4 + bodyLength;
    return received.size() >= length ? length : 0;
  }

  Answer answer_;
  LoopbackSocket socket_;
  std::thread acceptor_;
  mutable std::mutex mutex_;
  std::vector<std::string> requests_;
  std::vector<int> connections_;
  std::vector<std::thread> threads_;
};

/// A 200 answer with `body` and more header lines, each ending in CR LF.
inline std::string OkAnswer(const std::string& body, const std::string& headers = {}) {
  return "HTTP/1.1 200 OK\r\nContent-Type: text/xml\r\n" + headers +
         "Content-Length: " + std::to_string(body.size()) + "\r\n\r\n" + body;
}

}  // namespace SsoClient::Testing

#endif
