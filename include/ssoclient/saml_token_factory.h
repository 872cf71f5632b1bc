#ifndef SSOCLIENT_SAML_TOKEN_FACTORY_H
#define SSOCLIENT_SAML_TOKEN_FACTORY_H

#include <memory>
#include <string>

#include <ssoclient/saml_token.h>

namespace SsoClient {

/// Creates tokens for code that does not know the keys. Owned by a `std::shared_ptr` to the
/// concrete class. Implementations must be thread-safe. The order of the operations is part of the
/// binary interface.
class SamlTokenFactory {
 public:
  /// Does what the function `CreateSamlToken` does and throws what it throws. The default tolerance
  /// is 600 seconds.
  virtual std::shared_ptr<const SamlToken> CreateToken(const std::string& xml) const = 0;
  /// The same with another tolerance in seconds.
  virtual std::shared_ptr<const SamlToken> CreateToken(const std::string& xml,
                                                       long clockToleranceSec) const = 0;
  /// The same for the function `CreateSamlTokenFromDom`.
  virtual std::shared_ptr<const SamlToken> CreateToken(
      Tarnik::Xml::ElementNode* assertion) const = 0;
  /// The same with another tolerance in seconds.
  virtual std::shared_ptr<const SamlToken> CreateToken(Tarnik::Xml::ElementNode* assertion,
                                                       long clockToleranceSec) const = 0;

 protected:
  ~SamlTokenFactory() = default;
};

/// Creates a factory that verifies every token's signature with `resolver`, to which it keeps a
/// reference. With a null resolver, the factory does NOT verify signatures.
SSOCLIENT_EXPORT std::shared_ptr<SamlTokenFactory> CreateSamlTokenFactory(
    const Tarnik::Xml::Security::KeyInfoResolver* resolver);

}  // namespace SsoClient

#endif
