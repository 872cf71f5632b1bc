#include "connection.h"

#include <cstddef>
#include <exception>
#include <iostream>

#include <boost/asio/dispatch.hpp>
#include <boost/asio/use_awaitable.hpp>
#include <boost/beast/core/error.hpp>
#include <boost/beast/http.hpp>

#include "tls.h"

namespace GuardedServer {

namespace asio = boost::asio;
namespace beast = boost::beast;
namespace http = beast::http;
using SsoClient::Access::Presenter;

namespace {

constexpr std::chrono::seconds kIdleLimit{60};  // until the next request begins
constexpr std::chrono::seconds kEndLimit{1};    // for the client's end of TLS
constexpr std::size_t kLargestHeader = std::size_t{64} * 1024;
constexpr std::size_t kLargestBody = std::size_t{512} * 1024;

}  // namespace

Connection::Connection(asio::ip::tcp::socket socket, const ConnectionConfig& config)
    : config_(config), stream_(std::move(socket), *config.tls), buffer_(2 * kLargestHeader) {}

asio::awaitable<void> Connection::Serve() {
  try {
    co_await ServeRequests();
  } catch (const beast::system_error&) {
    // The client closed the connection, was too slow or does not speak TLS, or the server stops.
  } catch (const std::exception& e) {
    std::cerr << sender_ + ": " + e.what() + '\n';
  }
}

void Connection::Stop() {
  asio::dispatch(stream_.get_executor(), [self = shared_from_this()] {
    self->isStopping_ = true;
    if (!self->isSending_) {
      beast::get_lowest_layer(self->stream_).close();
    }
  });
}

asio::awaitable<void> Connection::ServeRequests() {
  const auto peer = beast::get_lowest_layer(stream_).socket().remote_endpoint();
  sender_ = peer.address().to_string() + ':' + std::to_string(peer.port());
  SetTimeLimit(config_.timeLimit);
  co_await stream_.async_handshake(asio::ssl::stream_base::server, asio::use_awaitable);
  const auto presenter = Presenter::WithTlsCertificate(PeerCertificate(stream_.native_handle()));
  for (bool isOpen = true; isOpen && !isStopping_;) {
    co_await AwaitRequest();
    Response response = co_await ReadAndAnswer(presenter);
    isOpen = response.keep_alive();
    co_await Send(response);
  }
  SetTimeLimit(kEndLimit);
  co_await stream_.async_shutdown(asio::use_awaitable);
}

asio::awaitable<void> Connection::AwaitRequest() {
  if (buffer_.size() == 0) {
    SetTimeLimit(kIdleLimit);
    const auto space = buffer_.prepare(4096);
    buffer_.commit(co_await stream_.async_read_some(space, asio::use_awaitable));
  }
}

asio::awaitable<Response> Connection::ReadAndAnswer(const Presenter& presenter) {
  try {
    const Request request = co_await Read();
    Response response = config_.guard->Answer(request, presenter, sender_);
    response.keep_alive(request.keep_alive() && !isStopping_);
    co_return response;
  } catch (const beast::system_error& e) {
    co_return AnswerTo(e.code());
  }
}

asio::awaitable<Request> Connection::Read() {
  http::request_parser<http::string_body> parser;
  parser.header_limit(kLargestHeader);
  parser.body_limit(kLargestBody);
  SetTimeLimit(config_.timeLimit);
  co_await http::async_read_header(stream_, buffer_, parser, asio::use_awaitable);
  const http::request_header<> header = parser.get().base();
  if (!HasClearEnd(header)) {
    throw beast::system_error(http::error::bad_transfer_encoding);
  }
  co_await http::async_read(stream_, buffer_, parser, asio::use_awaitable);
  // The parser has added the fields of a trailer to those of the header, where a token must be
  // (RFC 9110, section 6.5.1).
  Request request = parser.release();
  request.base() = header;
  co_return request;
}

asio::awaitable<void> Connection::Send(Response& response) {
  response.prepare_payload();
  SetTimeLimit(config_.timeLimit);
  isSending_ = true;
  co_await http::async_write(stream_, response, asio::use_awaitable);
  isSending_ = false;
}

void Connection::SetTimeLimit(std::chrono::milliseconds limit) {
  beast::get_lowest_layer(stream_).expires_after(limit);
}

}  // namespace GuardedServer
