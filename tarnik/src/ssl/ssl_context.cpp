#include <algorithm>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "ssl/client_identity.h"
#include "ssl/ssl_context_impl.h"
#include "ssl/ssl_stream.h"
#include "ssl/tls_engine.h"
#include "ssl/trust_store.h"
#include "support/openssl_error.h"

namespace Tarnik::Ssl {
namespace {

// Forward secrecy and authenticated peers only (RFC 9325, sections 4.1 and 4.2).
constexpr const char* kTls12Ciphers =
    "ECDHE+AESGCM:ECDHE+CHACHA20:DHE+AESGCM:DHE+CHACHA20:ECDHE+AES:DHE+AES:"
    "!aNULL:!eNULL:!aPSK:!SRP";
constexpr int kSecurityLevel = 2;

// Everything is set explicitly, since OpenSSL's system-wide configuration may have weakened the
// defaults.
bool ApplyPolicy(SSL_CTX* context) {
  SSL_CTX_set_security_level(context, kSecurityLevel);
  SSL_CTX_clear_options(context,
                        SSL_OP_LEGACY_SERVER_CONNECT | SSL_OP_ALLOW_UNSAFE_LEGACY_RENEGOTIATION);
  SSL_CTX_set_options(context,
                      SSL_OP_NO_COMPRESSION | SSL_OP_NO_RENEGOTIATION | SSL_OP_CLEANSE_PLAINTEXT);
  SSL_CTX_set_mode(context, SSL_MODE_ENABLE_PARTIAL_WRITE | SSL_MODE_ACCEPT_MOVING_WRITE_BUFFER |
                                SSL_MODE_RELEASE_BUFFERS);
  return SSL_CTX_set_min_proto_version(context, TLS1_2_VERSION) == 1 &&
         SSL_CTX_set_max_proto_version(context, 0) == 1 &&
         SSL_CTX_set_cipher_list(context, kTls12Ciphers) == 1;
}

OpenSsl::OwnedSslContext MakeContext(const SSLContextConfig& config) {
  const OpenSsl::ErrorScope errors;
  OpenSsl::OwnedSslContext context(SSL_CTX_new(TLS_client_method()));
  if (context == nullptr || !ApplyPolicy(context.get())) {
    throw SSLException(errors.Describe("Cannot set up TLS"));
  }
  TlsEngine::InstallCallbacks(context.get());
  LoadTrust(config, SSL_CTX_get_cert_store(context.get()));
  LoadClientIdentity(config, context.get());
  return context;
}

const PinnedCertificates& RequireNoNull(const PinnedCertificates& pinned) {
  if (std::find(pinned.begin(), pinned.end(), nullptr) != pinned.end()) {
    throw InvalidArgumentException("A pinned certificate of the SSL context is null.");
  }
  return pinned;
}

}  // namespace

SSLContextImpl::SSLContextImpl(const SSLContextConfig& config)
    : context_(MakeContext(config)), pinned_(RequireNoNull(config.pinnedCertificates)) {}

Ref<SSLStream> SSLContextImpl::WrapStream(System::Stream* stream, const std::string& name) {
  if (stream == nullptr) {
    throw InvalidArgumentException("There is no stream to run TLS on.");
  }
  return CreateSSLStream(this, stream, name);
}

Ref<SSLContext> CreateSSLContext(const SSLContextConfig& config) {
  return MakeRef<SSLContextImpl>(config);
}

}  // namespace Tarnik::Ssl
