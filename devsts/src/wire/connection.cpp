#include "wire/connection.h"

#include <algorithm>
#include <array>
#include <limits>

#include <openssl/err.h>
#include <poll.h>
#include <sys/socket.h>
#include <unistd.h>

namespace DevSts {
namespace {

constexpr std::chrono::seconds kLinger{5};

int AsInt(std::size_t size) {
  return static_cast<int>(
      std::min(size, static_cast<std::size_t>(std::numeric_limits<int>::max())));
}

}  // namespace

void Connection::Prepare(SSL_CTX* tls) {
  SSL_CTX_set_client_hello_cb(tls, ReadServerName, nullptr);
}

// RFC 6066, section 3: list length, name type 0, name length, name.
int Connection::ReadServerName(SSL* tls, int* /*alert*/, void* /*context*/) {
  constexpr std::size_t kPrefix = 5;
  const unsigned char* octets = nullptr;
  std::size_t size = 0;
  auto* connection = static_cast<Connection*>(SSL_get_app_data(tls));
  if (SSL_client_hello_get0_ext(tls, TLSEXT_TYPE_server_name, &octets, &size) == 1 &&
      size > kPrefix) {
    connection->serverName_.assign(octets + kPrefix, octets + size);
  }
  return SSL_CLIENT_HELLO_SUCCESS;
}

Connection::Connection(int socket, SSL_CTX* tls) : socket_(socket) {
  if (tls == nullptr) {
    return;
  }
  tls_.reset(SSL_new(tls));
  if (!tls_ || SSL_set_fd(tls_.get(), socket_) != 1) {
    ThrowOpenSslError("TLS connection");
  }
  SSL_set_app_data(tls_.get(), this);
}

Connection::~Connection() {
  tls_.reset();
  close(socket_);
}

bool Connection::Handshake() {
  if (!tls_) {
    return true;
  }
  ERR_clear_error();
  const bool done = SSL_accept(tls_.get()) == 1;
  ERR_clear_error();
  return done;
}

std::size_t Connection::Read(char* data, std::size_t size) {
  const long received =
      tls_ ? SSL_read(tls_.get(), data, AsInt(size)) : recv(socket_, data, size, 0);
  ERR_clear_error();
  return received > 0 ? static_cast<std::size_t>(received) : 0;
}

bool Connection::Write(std::string_view octets) {
  while (!octets.empty()) {
    const long sent = tls_ ? SSL_write(tls_.get(), octets.data(), AsInt(octets.size()))
                           : send(socket_, octets.data(), octets.size(), MSG_NOSIGNAL);
    ERR_clear_error();
    if (sent <= 0) {
      return false;
    }
    octets.remove_prefix(static_cast<std::size_t>(sent));
  }
  return true;
}

bool Connection::WaitForEnd(std::optional<std::chrono::milliseconds> limit) {
  pollfd entry{socket_, POLLRDHUP, 0};
  return poll(&entry, 1, limit ? AsInt(static_cast<std::size_t>(limit->count())) : -1) != 0;
}

void Connection::Finish(CutStyle style) {
  if (style == CutStyle::Reset) {
    const linger noLinger{1, 0};
    setsockopt(socket_, SOL_SOCKET, SO_LINGER, &noLinger, sizeof noLinger);
    return;
  }
  if (tls_ && style == CutStyle::Orderly) {
    SSL_shutdown(tls_.get());
    ERR_clear_error();
  }
  shutdown(socket_, SHUT_WR);
  DrainUntilEnd();
}

void Connection::DrainUntilEnd() {
  const auto end = std::chrono::steady_clock::now() + kLinger;
  std::array<char, 4096> octets{};
  for (;;) {
    const auto left = std::chrono::duration_cast<std::chrono::milliseconds>(
        end - std::chrono::steady_clock::now());
    pollfd entry{socket_, POLLIN, 0};
    if (left.count() <= 0 || poll(&entry, 1, static_cast<int>(left.count())) <= 0 ||
        recv(socket_, octets.data(), octets.size(), 0) <= 0) {
      return;
    }
  }
}

void Connection::Abort() {
  shutdown(socket_, SHUT_RDWR);
}

bool Connection::SessionReused() const {
  return tls_ && SSL_session_reused(tls_.get()) == 1;
}

std::string Connection::TlsVersion() const {
  return tls_ ? SSL_get_version(tls_.get()) : "";
}

std::string Connection::PeerCertificatePem() const {
  X509* certificate = tls_ ? SSL_get0_peer_certificate(tls_.get()) : nullptr;
  return certificate != nullptr ? CertificateToPem(certificate) : "";
}

}  // namespace DevSts
