#include "bare_client.h"

#include <stdexcept>
#include <utility>

#include <boost/asio/io_context.hpp>
#include <boost/asio/ip/tcp.hpp>
#include <boost/asio/ssl.hpp>
#include <boost/asio/write.hpp>
#include <boost/beast/core/flat_buffer.hpp>
#include <boost/beast/http/parser.hpp>
#include <boost/beast/http/read.hpp>
#include <boost/beast/http/string_body.hpp>

namespace Bench {
namespace {

namespace asio = boost::asio;
namespace http = boost::beast::http;
using asio::ip::tcp;

using Session = std::unique_ptr<SSL_SESSION, decltype(&SSL_SESSION_free)>;

// Where a TLS context keeps the last session. Asio uses OpenSSL's app data for itself.
int SessionSlot() {
  static const int slot = SSL_CTX_get_ex_new_index(0, nullptr, nullptr, nullptr, nullptr);
  return slot;
}

int KeepSession(SSL* connection, SSL_SESSION* session) {
  void* kept = SSL_CTX_get_ex_data(SSL_get_SSL_CTX(connection), SessionSlot());
  static_cast<Session*>(kept)->reset(session);
  return 1;
}

}  // namespace

struct BareClient::State {
  asio::io_context io;
  asio::ssl::context tls{asio::ssl::context::tls_client};
  Session lastSession{nullptr, &SSL_SESSION_free};
  tcp::endpoint endpoint;
  std::size_t resumed = 0;
};

BareClient::BareClient(const std::string& caFile, const std::string& host, unsigned short port)
    : state_(std::make_unique<State>()) {
  SSL_CTX* context = state_->tls.native_handle();
  SSL_CTX_set_min_proto_version(context, TLS1_2_VERSION);
  SSL_CTX_set_options(context, SSL_OP_NO_COMPRESSION | SSL_OP_NO_RENEGOTIATION);
  SSL_CTX_set_session_cache_mode(context, SSL_SESS_CACHE_CLIENT | SSL_SESS_CACHE_NO_INTERNAL);
  SSL_CTX_sess_set_new_cb(context, KeepSession);
  SSL_CTX_set_ex_data(context, SessionSlot(), &state_->lastSession);
  state_->tls.load_verify_file(caFile);
  state_->tls.set_verify_mode(asio::ssl::verify_peer);
  state_->tls.set_verify_callback(asio::ssl::host_name_verification(host));
  state_->endpoint = tcp::endpoint(asio::ip::make_address(host), port);
}

BareClient::~BareClient() = default;

std::string BareClient::Exchange(const std::string& request) {
  asio::ssl::stream<tcp::socket> stream(state_->io, state_->tls);
  stream.next_layer().connect(state_->endpoint);
  stream.next_layer().set_option(tcp::no_delay(true));
  if (state_->lastSession != nullptr) {
    SSL_set_session(stream.native_handle(), state_->lastSession.get());
  }
  stream.handshake(asio::ssl::stream_base::client);
  state_->resumed += SSL_session_reused(stream.native_handle()) == 1 ? 1 : 0;
  asio::write(stream, asio::buffer(request));
  boost::beast::flat_buffer buffer;
  http::response_parser<http::string_body> parser;
  http::read(stream, buffer, parser);
  // OpenSSL does not resume a session whose connection ended without a close_notify.
  SSL_set_shutdown(stream.native_handle(), SSL_SENT_SHUTDOWN | SSL_RECEIVED_SHUTDOWN);
  if (parser.get().result() != http::status::ok) {
    throw std::runtime_error("the service returned an error to a bare client");
  }
  return std::move(parser.get().body());
}

std::size_t BareClient::Resumed() const {
  return state_->resumed;
}

}  // namespace Bench
