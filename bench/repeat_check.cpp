// Checks of a token, by themselves and at a gate, for counts of their instructions.
#include <memory>

#include <ssoclient/saml_token.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "repeat.h"
#include "sample_gate.h"

namespace Bench {
namespace {

std::function<void()> PrepareCheck(const SampleToken& token) {
  const auto resolver = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::CreateCertificatesFromPem(token.certificatePem));
  return [resolver, xml = token.xml] { SsoClient::CreateSamlToken(xml, resolver.get()); };
}

std::function<void()> PrepareGate(const SampleToken& token, std::size_t cachedTokens) {
  const auto gate = MakeSampleGate(token, cachedTokens);
  CheckAccepted(*gate, token.xml);
  return [gate, xml = token.xml] { CheckAccepted(*gate, xml); };
}

}  // namespace

std::function<void()> PrepareOperation(const std::string& name, const RepeatInputs& inputs) {
  if (name == "check_token") {
    return PrepareCheck(inputs.token);
  }
  if (name == "gate_read") {
    return PrepareGate(inputs.token, 0);
  }
  if (name == "gate_hit") {
    return PrepareGate(inputs.token, 1000);
  }
  return {};
}

}  // namespace Bench
