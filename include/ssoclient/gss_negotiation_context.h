#ifndef SSOCLIENT_GSS_NEGOTIATION_CONTEXT_H
#define SSOCLIENT_GSS_NEGOTIATION_CONTEXT_H

#include <memory>
#include <vector>

#include <ssoclient/export.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/security_token_service_config.h>
#include <ssoclient/token_spec.h>

namespace SsoClient::InternalApi {

/// What one leg of a negotiation gives.
struct GssNegotiationResult {
  /// The service's leg, for the caller's GSS library; never null, possibly empty.
  std::shared_ptr<std::vector<unsigned char>> outputLeg;
  /// Null until the leg on which the service issues the token.
  std::shared_ptr<const SamlToken> token;
};

/// A negotiated login (SPNego in WS-Trust 1.3, section 8) that the caller drives leg by leg, until
/// there is a token. All legs travel in one session with its cookies. Used by one thread at a time;
/// different contexts are independent.
class GssNegotiationContext {
 public:
  /// Sends `inputLeg` and waits for the answer, 40 seconds at most. When the service answers
  /// without naming the negotiation, the next call starts a new one.
  ///
  /// Throws as `SecurityTokenService::AcquireToken` does. The state is then as before, except that
  /// an answer which could be read has named the negotiation.
  virtual GssNegotiationResult Negotiate(const std::vector<unsigned char>& inputLeg) = 0;

 protected:
  ~GssNegotiationContext() = default;
};

/// A context that asks for a token by `spec`. Of `config` it reads `url`, `sslContext`,
/// `sslPeerName`, `holderOfKeyConfig`, and `keyInfoResolver`, which verifies the token; with a null
/// resolver a token's signature is not verified. Throws `Tarnik::InvalidArgumentException` as
/// `CreateSecurityTokenService` does for these.
SSOCLIENT_EXPORT std::shared_ptr<GssNegotiationContext> CreateGssNegotiationContext(
    const SecurityTokenServiceConfig& config, const TokenSpec& spec);

}  // namespace SsoClient::InternalApi

#endif
