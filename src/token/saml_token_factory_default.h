#ifndef SSOCLIENT_TOKEN_SAML_TOKEN_FACTORY_DEFAULT_H
#define SSOCLIENT_TOKEN_SAML_TOKEN_FACTORY_DEFAULT_H

#include <memory>
#include <string>

#include <ssoclient/saml_token_factory.h>
#include <tarnik/core/ref.h>

namespace SsoClient {

/// Creates tokens and verifies their signatures with one resolver, which it keeps alive.
class SamlTokenFactoryDefault : public SamlTokenFactory {
 public:
  explicit SamlTokenFactoryDefault(const Tarnik::Xml::Security::KeyInfoResolver* resolver)
      : resolver_(resolver) {}

  std::shared_ptr<const SamlToken> CreateToken(const std::string& xml) const override;
  std::shared_ptr<const SamlToken> CreateToken(const std::string& xml,
                                               long clockToleranceSec) const override;
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode* assertion) const override;
  std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode* assertion,
                                               long clockToleranceSec) const override;

 private:
  Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> resolver_;
};

}  // namespace SsoClient

#endif
