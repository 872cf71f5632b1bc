#include "token/saml_token_factory_default.h"

#include "support/clock_tolerance.h"

namespace SsoClient {

std::shared_ptr<const SamlToken> SamlTokenFactoryDefault::CreateToken(
    const std::string& xml) const {
  return CreateToken(xml, kDefaultClockToleranceSec);
}

std::shared_ptr<const SamlToken> SamlTokenFactoryDefault::CreateToken(
    const std::string& xml, long clockToleranceSec) const {
  return CreateSamlToken(xml, resolver_.get(), clockToleranceSec);
}

std::shared_ptr<const SamlToken> SamlTokenFactoryDefault::CreateToken(
    Tarnik::Xml::ElementNode* assertion) const {
  return CreateToken(assertion, kDefaultClockToleranceSec);
}

std::shared_ptr<const SamlToken> SamlTokenFactoryDefault::CreateToken(
    Tarnik::Xml::ElementNode* assertion, long clockToleranceSec) const {
  return CreateSamlTokenFromDom(assertion, resolver_.get(), clockToleranceSec);
}

std::shared_ptr<SamlTokenFactory> CreateSamlTokenFactory(
    const Tarnik::Xml::Security::KeyInfoResolver* resolver) {
  return std::make_shared<SamlTokenFactoryDefault>(resolver);
}

}  // namespace SsoClient
