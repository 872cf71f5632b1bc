#include "server.h"

#include <chrono>
#include <exception>
#include <iostream>

#include <boost/asio/co_spawn.hpp>
#include <boost/asio/dispatch.hpp>
#include <boost/asio/redirect_error.hpp>
#include <boost/asio/steady_timer.hpp>
#include <boost/asio/use_awaitable.hpp>

namespace GuardedServer {

namespace asio = boost::asio;
using asio::ip::tcp;

Server::Server(asio::thread_pool& pool, ConnectionConfig config)
    : pool_(pool),
      config_(std::move(config)),
      strand_(asio::make_strand(pool)),
      acceptor_(strand_, tcp::endpoint(asio::ip::address_v4::loopback(), 0)) {}

void Server::Start() {
  // A server that cannot accept connections any more is to end.
  asio::co_spawn(strand_, Accept(), [](const std::exception_ptr& failure) {
    if (failure != nullptr) {
      std::rethrow_exception(failure);
    }
  });
}

void Server::Stop() {
  asio::dispatch(strand_, [this] {
    acceptor_.close();
    for (const auto& connection : connections_) {
      connection->Stop();
    }
  });
}

asio::awaitable<void> Server::Accept() {
  asio::steady_timer pause(strand_);
  while (acceptor_.is_open()) {
    tcp::socket socket(asio::make_strand(pool_));
    boost::system::error_code error;
    co_await acceptor_.async_accept(socket, asio::redirect_error(asio::use_awaitable, error));
    if (!acceptor_.is_open()) {
      break;
    }
    if (!error) {
      Serve(std::move(socket));
      continue;
    }
    std::cerr << "no connection accepted: " + error.message() + '\n';
    pause.expires_after(std::chrono::milliseconds(100));  // until others have closed files
    co_await pause.async_wait(asio::use_awaitable);
  }
}

void Server::Serve(tcp::socket socket) {
  if (connections_.size() >= kMaxConnections) {
    return;
  }
  const auto strand = socket.get_executor();
  const auto connection = std::make_shared<Connection>(std::move(socket), config_);
  connections_.insert(connection);
  asio::co_spawn(strand, connection->Serve(), [this, connection](const std::exception_ptr&) {
    asio::dispatch(strand_, [this, connection] { connections_.erase(connection); });
  });
}

}  // namespace GuardedServer
