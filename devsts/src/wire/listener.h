#ifndef DEVSTS_WIRE_LISTENER_H
#define DEVSTS_WIRE_LISTENER_H

#include <cstdint>
#include <functional>
#include <string>
#include <thread>

namespace DevSts {

// A listening TCP socket with a thread that accepts connections.
class Listener {
 public:
  // `accept` takes ownership of each new socket. Throws std::runtime_error.
  Listener(const std::string& address, std::uint16_t port, std::function<void(int)> accept);
  ~Listener();
  Listener(const Listener&) = delete;
  Listener& operator=(const Listener&) = delete;

  std::uint16_t Port() const { return port_; }

 private:
  void AcceptUntilStopped();

  int socket_;
  std::uint16_t port_;
  std::function<void(int)> accept_;
  std::thread thread_;
};

}  // namespace DevSts

#endif
