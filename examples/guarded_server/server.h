#ifndef GUARDED_SERVER_SERVER_H
#define GUARDED_SERVER_SERVER_H

#include <cstddef>
#include <memory>
#include <set>
#include <utility>

#include <boost/asio/awaitable.hpp>
#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/ssl/context.hpp>
#include <boost/asio/strand.hpp>
#include <boost/asio/thread_pool.hpp>

#include "connection.h"

namespace GuardedServer {

/// Accepts connections. `Stop` is thread-safe; the pool's threads must have ended before the
/// destructor.
class Server {
 public:
  /// Further connections are closed when they are accepted.
  static constexpr std::size_t kMaxConnections = 256;

  /// Listens on a free port of 127.0.0.1. Throws when it cannot.
  Server(boost::asio::thread_pool& pool, ConnectionConfig config);

  unsigned short Port() const { return acceptor_.local_endpoint().port(); }
  /// Begins to accept connections. Called once.
  void Start();
  /// Closes the listening socket and the connections; answers that have been begun are completed.
  void Stop();

 private:
  boost::asio::awaitable<void> Accept();
  void Serve(boost::asio::ip::tcp::socket socket);

  boost::asio::thread_pool& pool_;
  ConnectionConfig config_;
  boost::asio::strand<boost::asio::thread_pool::executor_type> strand_;
  boost::asio::ip::tcp::acceptor acceptor_;
  std::set<std::shared_ptr<Connection>> connections_;
};

}  // namespace GuardedServer

#endif
