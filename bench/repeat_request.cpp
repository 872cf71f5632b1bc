// Makes signed requests, for counts of their instructions.
#include <memory>

#include <ssoclient/saml_token.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>

#include "repeat.h"
#include "sts/request_builder.h"

namespace Bench {

std::function<void()> PrepareOperation(const std::string& name, const RepeatInputs& inputs) {
  const auto builder =
      std::make_shared<const SsoClient::RequestBuilderImpl>(SsoClient::HolderOfKeyConfig{
          Tarnik::Crypto::CreateCertificatesFromPem(inputs.clientCertificatePem).front(),
          Tarnik::Crypto::CreatePrivateKeyFromPem(inputs.clientKeyPem)});
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  if (name == "sign_request") {
    return [builder, spec] {
      SsoClient::SoapRequest request;
      builder->BuildAcquireTokenByCertificateRequest(spec, request);
    };
  }
  if (name == "sign_token_request") {
    const auto token = SsoClient::CreateSamlToken(inputs.token.xml);
    return [builder, spec, token] {
      SsoClient::SoapRequest request;
      builder->BuildAcquireTokenByTokenRequest(*token, spec, request);
    };
  }
  return {};
}

}  // namespace Bench
