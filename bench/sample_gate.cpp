#include "sample_gate.h"

#include <stdexcept>

namespace Bench {

using SsoClient::Access::TokenGate;

std::shared_ptr<TokenGate> MakeSampleGate(const SampleToken& sample, std::size_t cachedTokens) {
  SsoClient::Access::TrustedIssuer issuer;
  issuer.isForAnyIssuer = true;
  issuer.certificates = Tarnik::Crypto::CreateCertificatesFromPem(sample.certificatePem);
  SsoClient::Access::TrustStoreConfig trust;
  trust.issuers = {issuer};
  trust.isWatching = false;
  SsoClient::Access::GateConfig config;
  config.trust = SsoClient::Access::CreateTrustStore(trust);
  config.audiences = {"https://service.example.com"};
  config.acceptsUnrestrictedTokens = true;
  config.bearerTokens = SsoClient::Access::BearerTokens::kAccept;
  config.largestToken = std::size_t{1} << 20U;
  config.cache.tokens = cachedTokens;
  return SsoClient::Access::CreateTokenGate(config);
}

void CheckAccepted(const TokenGate& gate, const std::string& xml) {
  if (!gate.Check(xml, SsoClient::Access::Presenter::Nobody()).IsAccepted()) {
    throw std::runtime_error("The sample token is refused.");
  }
}

}  // namespace Bench
