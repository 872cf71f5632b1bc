#include "tls.h"

#include <cstddef>
#include <new>

#include <openssl/ssl.h>
#include <openssl/x509.h>

namespace GuardedServer {

namespace ssl = boost::asio::ssl;

std::shared_ptr<ssl::context> MakeTlsContext(const std::string& certificateFile,
                                             const std::string& keyFile) {
  auto context = std::make_shared<ssl::context>(ssl::context::tls_server);
  context->use_certificate_chain_file(certificateFile);
  context->use_private_key_file(keyFile, ssl::context::pem);
  context->set_verify_mode(ssl::verify_peer);
  context->set_verify_callback([](bool, ssl::verify_context& verified) {
    return X509_STORE_CTX_get_error(verified.native_handle()) != X509_V_ERR_EE_KEY_TOO_SMALL;
  });
  // Every connection has a handshake of its own: no session is resumed, and none is renegotiated
  // with another certificate.
  SSL_CTX* const native = context->native_handle();
  SSL_CTX_set_security_level(native, 2);  // RSA keys of 2048 bits
  SSL_CTX_set_min_proto_version(native, TLS1_2_VERSION);
  SSL_CTX_set_options(native, SSL_OP_NO_TICKET | SSL_OP_NO_RENEGOTIATION);
  SSL_CTX_set_session_cache_mode(native, SSL_SESS_CACHE_OFF);
  SSL_CTX_set_num_tickets(native, 0);
  return context;
}

Tarnik::Ref<const Tarnik::Crypto::Certificate> PeerCertificate(SSL* connection) {
  const X509* const certificate = SSL_get0_peer_certificate(connection);
  if (certificate == nullptr) {
    return nullptr;
  }
  unsigned char* bytes = nullptr;
  const int length = i2d_X509(certificate, &bytes);
  const auto release = [](unsigned char* p) { OPENSSL_free(p); };
  const std::unique_ptr<unsigned char, decltype(release)> owner(bytes, release);
  if (length < 0) {
    throw std::bad_alloc();
  }
  return Tarnik::Crypto::CreateCertificateFromDer(bytes, static_cast<std::size_t>(length));
}

}  // namespace GuardedServer
