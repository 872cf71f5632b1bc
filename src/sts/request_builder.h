#ifndef SSOCLIENT_STS_REQUEST_BUILDER_H
#define SSOCLIENT_STS_REQUEST_BUILDER_H

#include <cstdint>
#include <memory>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>

#include "transport/transport.h"
#include "xml/builders.h"

namespace SsoClient {

/// Builds the requests of a service's operations. Thread-safe.
///
/// Each operation assigns `request` only on success, and throws
///  - `Tarnik::InvalidArgumentException` when a lifetime is not positive, when XML cannot represent
///    a text (the message names the element, never the text), and when a token has an id of the
///    signed request itself;
///  - `Tarnik::InvalidStateException` when a key is needed and there is none, and when the
///    certificate of the key is not valid now;
///  - `Tarnik::Xml::XMLParseException` when the text of a presented token is malformed;
///  - `Tarnik::Xml::Security::XmlSecurityException` when the key cannot sign.
class RequestBuilder {
 public:
  /// A token by user name and password; signed if the token is to be bound to the key.
  virtual void BuildAcquireTokenRequest(const std::string& userName, const std::string& password,
                                        const TokenSpec& spec, SoapRequest& request) const = 0;
  /// The first leg of a negotiation for a token; signed under the same condition.
  virtual void BuildInitialNegotiationRequest(const TokenSpec& spec,
                                              const std::vector<unsigned char>& leg,
                                              SoapRequest& request) const = 0;
  /// A later leg of the negotiation to which the service assigned `contextId`.
  virtual void BuildContinuedNegotiationRequest(const std::string& contextId,
                                                const std::vector<unsigned char>& leg,
                                                SoapRequest& request) const = 0;
  /// A token by the certificate of the key. The spec's confirmation must be the default.
  virtual void BuildAcquireTokenByCertificateRequest(const TokenSpec& spec,
                                                     SoapRequest& request) const = 0;
  /// A token by `token`, which is bound to the key.
  virtual void BuildAcquireTokenByTokenRequest(const SamlToken& token, const TokenSpec& spec,
                                               SoapRequest& request) const = 0;
  /// The status of `token`.
  virtual void BuildValidateRequest(const SamlToken& token, SoapRequest& request) const = 0;
  /// A new lifetime of `lifetimeSec` seconds for `token`, which must be a holder-of-key token.
  virtual void BuildRenewRequest(const SamlToken& token, std::int64_t lifetimeSec,
                                 SoapRequest& request) const = 0;

 protected:
  ~RequestBuilder() = default;
};

/// Builds requests and signs those that prove possession of the key.
class RequestBuilderImpl final : public RequestBuilder {
 public:
  explicit RequestBuilderImpl(boost::optional<HolderOfKeyConfig> holderOfKeyConfig);

  void BuildAcquireTokenRequest(const std::string& userName, const std::string& password,
                                const TokenSpec& spec, SoapRequest& request) const override;
  void BuildInitialNegotiationRequest(const TokenSpec& spec, const std::vector<unsigned char>& leg,
                                      SoapRequest& request) const override;
  void BuildContinuedNegotiationRequest(const std::string& contextId,
                                        const std::vector<unsigned char>& leg,
                                        SoapRequest& request) const override;
  void BuildAcquireTokenByCertificateRequest(const TokenSpec& spec,
                                             SoapRequest& request) const override;
  void BuildAcquireTokenByTokenRequest(const SamlToken& token, const TokenSpec& spec,
                                       SoapRequest& request) const override;
  void BuildValidateRequest(const SamlToken& token, SoapRequest& request) const override;
  void BuildRenewRequest(const SamlToken& token, std::int64_t lifetimeSec,
                         SoapRequest& request) const override;

 private:
  const HolderOfKeyConfig& RequireHolderOfKey(const std::string& operation) const;
  bool AsksForHolderOfKey(const TokenSpec& spec) const;
  /// The key type that a request's body asks for, as `BuildIssueBody` expects it.
  unsigned KeyTypeFor(const TokenSpec& spec) const;
  /// The envelope of a request whose sender is authenticated by other means than the key. It is
  /// signed when the token is to be bound to the key.
  std::shared_ptr<XMLBaseBuilder> Enclose(const TokenSpec& spec,
                                          const std::shared_ptr<XMLBaseBuilder>& header,
                                          const std::shared_ptr<XMLBaseBuilder>& body) const;

  boost::optional<HolderOfKeyConfig> holderOfKeyConfig_;
};

}  // namespace SsoClient

#endif
