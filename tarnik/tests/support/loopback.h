#ifndef TARNIK_TESTS_SUPPORT_LOOPBACK_H
#define TARNIK_TESTS_SUPPORT_LOOPBACK_H

#include <cstddef>
#include <string>

namespace Tarnik::Testing {

/// A file descriptor that closes with its owner.
class Descriptor {
 public:
  explicit Descriptor(int value = -1) : value_(value) {}
  Descriptor(Descriptor&& other) noexcept : value_(other.value_) { other.value_ = -1; }
  Descriptor& operator=(Descriptor&& other) noexcept;
  Descriptor(const Descriptor&) = delete;
  Descriptor& operator=(const Descriptor&) = delete;
  ~Descriptor() { Close(); }

  int Get() const { return value_; }
  void Close();

 private:
  int value_;
};

/// Listens on an unused TCP port of the loopback interface.
class LoopbackListener {
 public:
  /// Listens on 127.0.0.1, or on ::1 if `ipv6`.
  explicit LoopbackListener(bool ipv6 = false, int backlog = 64);

  int Port() const { return port_; }
  int Get() const { return descriptor_.Get(); }
  /// Waits for a connection, at most 30 seconds.
  Descriptor Accept() const;
  void Close() { descriptor_.Close(); }

 private:
  Descriptor descriptor_;
  int port_ = 0;
};

bool HasIpv6Loopback();
/// Blocks until all is sent; returns false if the peer has gone.
bool SendAll(int socket, const std::string& data);
/// Blocks for `size` bytes; returns fewer only at the end of the stream or after a reset.
std::string ReceiveExactly(int socket, std::size_t size);
/// Makes the next close of `socket` reset the connection instead of closing it gracefully.
void ResetOnClose(int socket);
/// The loopback port of a socket that is bound but does not listen, so that connecting to it is
/// refused. `holder` owns the socket.
int RefusingPort(Descriptor& holder);

}  // namespace Tarnik::Testing

#endif
