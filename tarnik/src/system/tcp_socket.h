#ifndef TARNIK_SYSTEM_TCP_SOCKET_H
#define TARNIK_SYSTEM_TCP_SOCKET_H

#include <boost/asio/basic_stream_socket.hpp>
#include <boost/asio/io_context.hpp>
#include <boost/asio/ip/tcp.hpp>

#include "support/fork.h"

namespace Tarnik::System {

/// A socket of Asio whose connection exists in one process only: it is close-on-exec from birth,
/// and a forked child closes its copy, so that the peer sees the end when the parent closes the
/// socket. A child does not use or destroy the socket of its parent.
class TCPSocket {
 public:
  /// With the executor as a concrete type, so that operations do not allocate to hold it.
  using AsioSocket = boost::asio::basic_stream_socket<boost::asio::ip::tcp,
                                                      boost::asio::io_context::executor_type>;

  explicit TCPSocket(boost::asio::io_context& ioContext) : socket_(ioContext) {}
  ~TCPSocket() { Close(); }
  TCPSocket(const TCPSocket&) = delete;
  TCPSocket& operator=(const TCPSocket&) = delete;

  /// Opens a socket of the family AF_INET or AF_INET6.
  boost::system::error_code Open(int family) noexcept;
  void Close() noexcept;
  /// Closes this socket and takes over that of `other`, which is closed afterwards.
  void TakeOver(TCPSocket& other) noexcept;

  AsioSocket* operator->() noexcept { return &*socket_; }

 private:
  ForkBound<AsioSocket> socket_;
};

}  // namespace Tarnik::System

#endif
