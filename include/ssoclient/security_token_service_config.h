#ifndef SSOCLIENT_SECURITY_TOKEN_SERVICE_CONFIG_H
#define SSOCLIENT_SECURITY_TOKEN_SERVICE_CONFIG_H

#include <memory>
#include <string>

#include <boost/optional.hpp>

#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/saml_token_factory.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace SsoClient {

/// The configuration of a service. Read once, when the service is created; the service keeps its
/// own references to the objects that it uses.
struct SecurityTokenServiceConfig {
  /// The service's URL, http or https.
  std::string url;
  /// The source of the keys that verify the tokens of `InternalApi::CreateGssNegotiationContext`,
  /// which does not use `tokenFactory`. A service ignores it: it verifies tokens only through
  /// `tokenFactory`.
  const Tarnik::Xml::Security::KeyInfoResolver* keyInfoResolver = nullptr;
  /// Creates verified tokens from the service's answers; must not be null.
  std::shared_ptr<SamlTokenFactory> tokenFactory;
  /// The name that the service's TLS certificate must have; the URL's host if empty.
  std::string sslPeerName;
  /// The key for holder-of-key tokens. Without it all tokens are bearer tokens, and
  /// `AcquireTokenByCertificate`, `AcquireTokenByToken` and `RenewToken` throw.
  boost::optional<HolderOfKeyConfig> holderOfKeyConfig;
  /// The TLS trust and settings; may be null for an http URL.
  Tarnik::Ssl::SSLContext* sslContext = nullptr;
  /// Whether to look for a replacement host before each connection. There is no source of
  /// replacements yet, so connections go to the URL's host either way.
  bool flag = false;
};

/// The same for callers with their own HTTP user agent: to keep connections between operations
/// (`tarnik/http/connection_specs.h`) or to limit calls (`tarnik/http/bounded_user_agent.h`).
struct SecurityTokenServiceConfigEx {
  /// The request target of every POST, used unchanged.
  std::string url;
  /// Shared by all exchanges of the service; knows where and how to connect. Must not be null.
  Tarnik::Ref<Tarnik::Http::UserAgent> userAgent;
  /// Creates verified tokens from the service's answers; must not be null.
  std::shared_ptr<SamlTokenFactory> tokenFactory;
  /// As above.
  boost::optional<HolderOfKeyConfig> holderOfKeyConfig;
};

}  // namespace SsoClient

#endif
