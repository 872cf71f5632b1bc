#include <algorithm>
#include <array>

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

// Authenticated encryption with forward secrecy (RFC 9325, sections 4.1 and 4.2).
constexpr const char* kTls12Suites =
    "ECDHE-ECDSA-AES256-GCM-SHA384:ECDHE-RSA-AES256-GCM-SHA384:"
    "ECDHE-ECDSA-CHACHA20-POLY1305:ECDHE-RSA-CHACHA20-POLY1305:"
    "ECDHE-ECDSA-AES128-GCM-SHA256:ECDHE-RSA-AES128-GCM-SHA256";
// The suites of RFC 8446, section 9.1.
constexpr const char* kTls13Suites =
    "TLS_AES_256_GCM_SHA384:TLS_CHACHA20_POLY1305_SHA256:TLS_AES_128_GCM_SHA256";
// Of the peer and of the client (RFC 8446, section 4.2.3): neither SHA-1 nor SHA-224 nor DSA.
constexpr const char* kSignatureAlgorithms =
    "ecdsa_secp256r1_sha256:ecdsa_secp384r1_sha384:ecdsa_secp521r1_sha512:ed25519:ed448:"
    "rsa_pss_pss_sha256:rsa_pss_pss_sha384:rsa_pss_pss_sha512:"
    "rsa_pss_rsae_sha256:rsa_pss_rsae_sha384:rsa_pss_rsae_sha512:"
    "rsa_pkcs1_sha256:rsa_pkcs1_sha384:rsa_pkcs1_sha512";
// The first list that OpenSSL knows is used: older releases have no hybrid group, and some
// providers have no X25519. A star asks for a key share of a group, a slash starts a new rank.
constexpr std::array kGroups = {"*X25519MLKEM768/*X25519:P-256/P-384:P-521",
                                "X25519:P-256:P-384:P-521", "P-256:P-384:P-521"};
constexpr int kSecurityLevel = 2;

bool SetGroups(SSL_CTX* context) {
  return std::any_of(kGroups.begin(), kGroups.end(), [context](const char* groups) {
    return SSL_CTX_set1_groups_list(context, groups) == 1;
  });
}

// The options that OpenSSL sets by default are among these.
void SetOptions(SSL_CTX* context) {
  SSL_CTX_clear_options(context, SSL_CTX_get_options(context));
  SSL_CTX_set_options(context, SSL_OP_NO_COMPRESSION | SSL_OP_NO_RENEGOTIATION |
                                   SSL_OP_CLEANSE_PLAINTEXT | SSL_OP_ENABLE_MIDDLEBOX_COMPAT);
  SSL_CTX_set_mode(context, SSL_MODE_ENABLE_PARTIAL_WRITE | SSL_MODE_ACCEPT_MOVING_WRITE_BUFFER |
                                SSL_MODE_RELEASE_BUFFERS);
}

// OpenSSL's configuration file may have a section for all contexts of the process. Each setting
// that such a section can change and that decides what is offered or accepted is set here: the
// versions, suites, signature algorithms, groups, options and the security level.
bool ApplyPolicy(SSL_CTX* context) {
  SSL_CTX_set_security_level(context, kSecurityLevel);
  SetOptions(context);
  return SSL_CTX_set_min_proto_version(context, TLS1_2_VERSION) == 1 &&
         SSL_CTX_set_max_proto_version(context, 0) == 1 &&
         SSL_CTX_set_cipher_list(context, kTls12Suites) == 1 &&
         SSL_CTX_set_ciphersuites(context, kTls13Suites) == 1 &&
         SSL_CTX_set1_sigalgs_list(context, kSignatureAlgorithms) == 1 &&
         SSL_CTX_set1_client_sigalgs_list(context, kSignatureAlgorithms) == 1 && SetGroups(context);
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
