#ifndef TARNIK_SYSTEM_TCP_CLIENT_SOCKET_H
#define TARNIK_SYSTEM_TCP_CLIENT_SOCKET_H

#include <functional>
#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/cancellable_item.h>
#include <tarnik/system/stream.h>
#include <tarnik/system/thread_pool.h>

namespace Tarnik::System {

/// A TCP connection that is opened by this side.
class TARNIK_EXPORT TCPClientSocket : public Stream {
 public:
  /// Receives this socket, and null or the exception.
  using ConnectCompletion = std::function<void(TCPClientSocket*, Exception*)>;

  /// Resolves `host` (a name or a literal IPv4 or IPv6 address, without brackets) and connects to
  /// `port` at the first of its addresses that accepts the connection. The families of addresses
  /// take turns, and the next address is tried when the one before it has failed or has not
  /// answered for 250 ms (RFC 8305, sections 4 and 5). The completion receives this socket and
  /// null, or this socket and an `IOException` that names host, port and the last cause, or a
  /// `CancelledException` after `Close`. A thread for the look-up that cannot be started, and a
  /// shortage of memory after this call has returned, are such an `IOException` too. As in
  /// `Stream`, an exception that leaves the completion ends the process. Called once per socket.
  ///
  /// Throws `InvalidArgumentException` when `host` cannot be a host name (empty, too long, blanks,
  /// control characters, brackets, ...) or `port` is not 1 to 65535, and `InvalidStateException`
  /// when this function was called before or the socket belongs to the parent process. Reads and
  /// writes throw `InvalidStateException` before the connection is established and while another
  /// operation of their kind is under way.
  virtual void ConnectAsync(const std::string& host, int port, ConnectCompletion completion) = 0;
};

/// A new, unconnected socket whose completions run on the I/O threads of `pool`. Throws
/// `InvalidArgumentException` unless `pool` is the one that `GetThreadPool` returns, and
/// `ResourceException` or `InvalidStateException` when the pool cannot be started (`ThreadPool`).
TARNIK_EXPORT Ref<TCPClientSocket> CreateTCPClientSocket(ThreadPool* pool);

/// An item for a connect of `socket`, of which it holds one reference. `Cancel` closes the socket
/// and returns true. A user agent whose time limit passes during a connect with such an item can
/// say whether it was waiting for the host look-up or for the connection. Throws
/// `InvalidArgumentException` when `socket` is null.
TARNIK_EXPORT Ref<CancellableItem> CreateConnectItem(TCPClientSocket* socket);

}  // namespace Tarnik::System

#endif
