#include "support/tls_peer.h"

#include <cstddef>
#include <stdexcept>
#include <string>
#include <utility>
#include <vector>

#include <openssl/err.h>
#include <signal.h>
#include <sys/socket.h>
#include <sys/time.h>

#include "support/openssl.h"
#include "support/test_pki.h"

namespace Tarnik::Testing {
namespace {

constexpr time_t kSocketLimitSeconds = 30;

void LimitWaits(int socket) {
  const timeval limit{kSocketLimitSeconds, 0};
  setsockopt(socket, SOL_SOCKET, SO_RCVTIMEO, &limit, sizeof(limit));
  setsockopt(socket, SOL_SOCKET, SO_SNDTIMEO, &limit, sizeof(limit));
}

// OpenSSL's writes to sockets raise SIGPIPE when the peer has gone.
void IgnoreBrokenPipes() {
  sigset_t brokenPipe;
  sigemptyset(&brokenPipe);
  sigaddset(&brokenPipe, SIGPIPE);
  pthread_sigmask(SIG_BLOCK, &brokenPipe, nullptr);
}

std::string ClientCertificateOf(SSL* ssl) {
  unsigned char* bytes = nullptr;
  X509* certificate = SSL_get0_peer_certificate(ssl);
  const int length = certificate == nullptr ? 0 : i2d_X509(certificate, &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return length <= 0
             ? ""
             : std::string(reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(length));
}

void Greet(SSL* ssl) {
  TlsWrite(ssl, "hello");
  SSL_shutdown(ssl);
}

}  // namespace

OpenSsl::OwnedSslContext MakeServerContext(const TlsPeerOptions& options) {
  OpenSsl::OwnedSslContext context(SSL_CTX_new(TLS_server_method()));
  SSL_CTX_set_security_level(context.get(), options.securityLevel);
  const unsigned char sessionContext[] = "test";
  bool isGood = SSL_CTX_set_min_proto_version(context.get(), options.minVersion) == 1 &&
                SSL_CTX_set_max_proto_version(context.get(), options.maxVersion) == 1 &&
                SSL_CTX_set_cipher_list(context.get(), options.ciphers.c_str()) == 1 &&
                SSL_CTX_set_session_id_context(context.get(), sessionContext, 4) == 1;
  isGood = isGood && (options.signatures.empty() ||
                      SSL_CTX_set1_sigalgs_list(context.get(), options.signatures.c_str()) == 1);
  SSL_CTX_set_dh_auto(context.get(), 1);
  if (options.identity != nullptr) {
    isGood = isGood &&
             SSL_CTX_use_certificate(context.get(), options.identity->certificate.get()) == 1 &&
             SSL_CTX_use_PrivateKey(context.get(), options.identity->key.get()) == 1;
  }
  for (const Identity* issuer : options.chain) {
    isGood = isGood && SSL_CTX_add1_chain_cert(context.get(), issuer->certificate.get()) == 1;
  }
  if (options.clientCa != nullptr) {
    SSL_CTX_set_verify(context.get(), SSL_VERIFY_PEER | SSL_VERIFY_FAIL_IF_NO_PEER_CERT, nullptr);
    isGood = isGood && X509_STORE_add_cert(SSL_CTX_get_cert_store(context.get()),
                                           options.clientCa->certificate.get()) == 1;
  }
  if (!isGood) {
    throw std::runtime_error("cannot set up the test's TLS server");
  }
  return context;
}

TlsServer::TlsServer(const TlsPeerOptions& options, int connections, Handler serve)
    : context_(MakeServerContext(options)),
      serve_(serve ? std::move(serve) : Greet),
      thread_([this, connections] { Serve(connections); }) {}

const std::vector<TlsServer::Connection>& TlsServer::Join() {
  if (thread_.joinable()) {
    thread_.join();
  }
  return served_;
}

void TlsServer::Serve(int connections) {
  IgnoreBrokenPipes();
  for (int i = 0; i < connections; ++i) {
    const Descriptor socket = listener_.Accept();
    LimitWaits(socket.Get());
    ERR_clear_error();
    const OpenSsl::OwnedSsl ssl(SSL_new(context_.get()));
    SSL_set_fd(ssl.get(), socket.Get());
    Connection connection;
    connection.accepted = SSL_accept(ssl.get()) == 1;
    connection.resumed = SSL_session_reused(ssl.get()) == 1;
    const char* serverName = SSL_get_servername(ssl.get(), TLSEXT_NAMETYPE_host_name);
    connection.serverName = serverName == nullptr ? "" : serverName;
    connection.clientCertificate = ClientCertificateOf(ssl.get());
    served_.push_back(connection);
    if (connection.accepted) {
      serve_(ssl.get());
    }
  }
  ERR_clear_error();
}

bool TlsWrite(SSL* ssl, const std::string& data) {
  std::size_t written = 0;
  return data.empty() || SSL_write_ex(ssl, data.data(), data.size(), &written) == 1;
}

std::string TlsReadExactly(SSL* ssl, std::size_t size) {
  std::string data(size, '\0');
  std::size_t received = 0;
  while (received < size) {
    std::size_t now = 0;
    if (SSL_read_ex(ssl, data.data() + received, size - received, &now) != 1) {
      break;
    }
    received += now;
  }
  data.resize(received);
  return data;
}

}  // namespace Tarnik::Testing
