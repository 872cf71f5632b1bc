#ifndef GUARDED_SERVER_CONNECTION_H
#define GUARDED_SERVER_CONNECTION_H

#include <chrono>
#include <memory>
#include <string>
#include <utility>

#include <boost/asio/awaitable.hpp>
#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/ssl/context.hpp>
#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/core/tcp_stream.hpp>
#include <boost/beast/ssl/ssl_stream.hpp>

#include "guard.h"

namespace GuardedServer {

struct ConnectionConfig {
  std::shared_ptr<boost::asio::ssl::context> tls;
  std::shared_ptr<const Guard> guard;
  /// For a handshake, a request and an answer each.
  std::chrono::milliseconds timeLimit{std::chrono::seconds(10)};
};

/// A TLS connection of a client. All that it does is limited in time and size, so that a client
/// that is slow or sends garbage costs no more than one connection for a while.
class Connection : public std::enable_shared_from_this<Connection> {
 public:
  Connection(boost::asio::ip::tcp::socket socket, const ConnectionConfig& config);

  /// Answers requests until the client or `Stop` ends the connection. Runs on the socket's strand.
  boost::asio::awaitable<void> Serve();
  /// Ends the connection, after the answer that is being sent, if there is one. Thread-safe.
  void Stop();

 private:
  boost::asio::awaitable<void> ServeRequests();
  boost::asio::awaitable<Response> ReadAndAnswer(const SsoClient::Access::Presenter& presenter);
  boost::asio::awaitable<Request> Read();
  boost::asio::awaitable<void> Send(Response& response);
  boost::asio::awaitable<void> AwaitRequest();
  void SetTimeLimit(std::chrono::milliseconds limit);

  ConnectionConfig config_;
  boost::beast::ssl_stream<boost::beast::tcp_stream> stream_;
  boost::beast::flat_buffer buffer_;
  std::string sender_;
  bool isSending_ = false;
  bool isStopping_ = false;
};

}  // namespace GuardedServer

#endif
