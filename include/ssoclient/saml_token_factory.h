#ifndef SSOCLIENT_SAML_TOKEN_FACTORY_H
#define SSOCLIENT_SAML_TOKEN_FACTORY_H

#include <memory>
#include <string>

#include <ssoclient/saml_token.h>

namespace SsoClient {

/// Creates tokens for those who do not know the keys. Owned through `std::shared_ptr`, which
/// deletes the implementation. Implementations must be safe to use from many threads. The order of
/// the operations is part of the binary interface.
class SamlTokenFactory {
 public:
  /// As the function `CreateSamlToken`, with a tolerance of 600 seconds where none is given, and
  /// throws what it throws.
  virtual std::shared_ptr<const SamlToken> CreateToken(const std::string& xml) const = 0;
  virtual std::shared_ptr<const SamlToken> CreateToken(const std::string& xml,
                                                       long clockToleranceSec) const = 0;
  /// As the function `CreateSamlTokenFromDom`.
  virtual std::shared_ptr<const SamlToken> CreateToken(
      Tarnik::Xml::ElementNode* assertion) const = 0;
  virtual std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode* assertion,
                                                       long clockToleranceSec) const = 0;

 protected:
  ~SamlTokenFactory() = default;
};

/// A factory that verifies every token's signature with `resolver`, to which it keeps a reference.
/// A null resolver gives a factory that verifies no signature.
SSOCLIENT_EXPORT std::shared_ptr<SamlTokenFactory> CreateSamlTokenFactory(
    const Tarnik::Xml::Security::KeyInfoResolver* resolver);

}  // namespace SsoClient

#endif
