#ifndef DEVSTS_WIRE_LISTENER_H
#define DEVSTS_WIRE_LISTENER_H

#include <atomic>
#include <cstdint>
#include <functional>
#include <string>
#include <thread>

namespace DevSts {

// A listening TCP socket with a thread that accepts connections.
class Listener {
 public:
  // `accept` takes ownership of each new socket. `failed` is called when the socket can accept no
  // more. Both run on the thread and must not throw. Throws std::runtime_error.
  Listener(const std::string& address, std::uint16_t port, std::function<void(int)> accept,
           std::function<void(const std::string& message)> failed);
  ~Listener();
  Listener(const Listener&) = delete;
  Listener& operator=(const Listener&) = delete;

  std::uint16_t Port() const { return port_; }

 private:
  void Accept();

  int socket_;
  std::uint16_t port_;
  std::atomic<bool> stopped_ = false;
  std::function<void(int)> accept_;
  std::function<void(const std::string&)> failed_;
  std::thread thread_;
};

}  // namespace DevSts

#endif
