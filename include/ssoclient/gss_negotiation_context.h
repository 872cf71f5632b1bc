#ifndef SSOCLIENT_GSS_NEGOTIATION_CONTEXT_H
#define SSOCLIENT_GSS_NEGOTIATION_CONTEXT_H

#include <memory>
#include <vector>

#include <ssoclient/export.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/security_token_service_config.h>
#include <ssoclient/token_spec.h>

namespace SsoClient::InternalApi {

/// The result of one leg of a negotiation.
struct GssNegotiationResult {
  /// The service's leg, for the caller's GSS library; never null, possibly empty.
  std::shared_ptr<std::vector<unsigned char>> outputLeg;
  /// Null until the service issues the token.
  std::shared_ptr<const SamlToken> token;
};

/// A negotiated login (SPNEGO in WS-Trust 1.3, section 8) that the caller drives leg by leg until
/// there is a token. All legs are sent in one session with its own cookies. Used by one thread at a
/// time; different contexts are independent.
class GssNegotiationContext {
 public:
  /// Sends `inputLeg` and waits for the answer, at most 40 seconds. When the answer has an empty
  /// negotiation id, the next call starts a new negotiation.
  ///
  /// Throws what `SecurityTokenService::AcquireToken` throws, with the configuration's resolver in
  /// the place of the token factory. The state is then unchanged, except that the negotiation id of
  /// an answer that could be read is kept.
  virtual GssNegotiationResult Negotiate(const std::vector<unsigned char>& inputLeg) = 0;

 protected:
  ~GssNegotiationContext() = default;
};

/// Creates a context that requests the token that `spec` describes. It uses the `url`,
/// `sslContext`, `sslPeerName`, `holderOfKeyConfig` and `keyInfoResolver` of `config`. The resolver
/// verifies the token; if it is null, the token's signature is NOT verified. Throws
/// `Tarnik::InvalidArgumentException` as `CreateSecurityTokenService` does for these fields.
SSOCLIENT_EXPORT std::shared_ptr<GssNegotiationContext> CreateGssNegotiationContext(
    const SecurityTokenServiceConfig& config, const TokenSpec& spec);

}  // namespace SsoClient::InternalApi

#endif
