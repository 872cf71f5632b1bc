#ifndef SSOCLIENT_XML_REQUEST_BODIES_H
#define SSOCLIENT_XML_REQUEST_BODIES_H

#include <cstdint>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <ssoclient/advice.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>

#include "support/secret_text.h"
#include "xml/builders.h"

namespace SsoClient {

/// wst:RequestSecurityToken that asks for a token (WS-Trust 1.3, section 4.1; ActAs as in WS-Trust
/// 1.4, section 9.3). `keyType` 0 asks for a bearer token, any other for a holder-of-key token.
///
/// Throws `Tarnik::InvalidArgumentException` when the spec's act-as token is set but null, and
/// `Tarnik::Xml::XMLParseException` when that token's text is malformed.
std::shared_ptr<XMLCompositeBuilder> BuildIssueBody(unsigned keyType, const TokenSpec& spec);

/// The same, followed by a wst:UseKey that names the request's signature as proof of possession
/// (WS-Trust 1.3, section 9.2) when `keyType` is 1 and the spec names no delegate.
std::shared_ptr<XMLCompositeBuilder> BuildIssueBodyWithUseKey(unsigned keyType,
                                                              const TokenSpec& spec);

/// wst:RequestSecurityToken that asks for `token` with a new lifetime of `lifetimeSec` seconds from
/// now (WS-Trust 1.3, section 5). Throws `Tarnik::Xml::XMLParseException` when the token's text is
/// malformed.
std::shared_ptr<XMLCompositeBuilder> BuildRenewBody(const SamlToken& token,
                                                    std::int64_t lifetimeSec);

/// wst:RequestSecurityToken that asks for the status of `token` (WS-Trust 1.3, section 7). Throws
/// `Tarnik::Xml::XMLParseException` when the token's text is malformed.
std::shared_ptr<XMLCompositeBuilder> BuildValidateBody(const SamlToken& token);

/// The request that opens an SPNEGO negotiation (WS-Trust 1.3, section 8): asks for a token and
/// contains the first leg. Each build generates a new context id. The leg is a credential: it is
/// cleansed from memory when the builder is destroyed.
class XMLBodyBuilderInitialSPNego final : public XMLBaseBuilder {
 public:
  /// `keyType` as for `BuildIssueBody`.
  XMLBodyBuilderInitialSPNego(unsigned keyType, TokenSpec spec, std::vector<unsigned char> leg);

  /// Throws as `BuildIssueBody` does.
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  unsigned keyType_;
  TokenSpec spec_;
  SecretBytes leg_;
};

/// A later leg of an SPNEGO negotiation (WS-Trust 1.3, section 8). An enclosing element declares
/// the prefix wst. The leg is cleansed as above.
class XMLBodyBuilderContinuedSPNego final : public XMLBaseBuilder {
 public:
  /// `contextId` is the id that the service assigned to the negotiation.
  XMLBodyBuilderContinuedSPNego(std::string contextId, std::vector<unsigned char> leg);

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::string contextId_;
  SecretBytes leg_;
};

// The parts of these bodies.

/// wst:Lifetime (WS-Trust 1.3, section 4.1) of `seconds` from now. Accepts any value.
std::shared_ptr<XMLCompositeBuilder> BuildLifetime(std::int64_t seconds);

/// wst:Participants (WS-Trust 1.3, section 9.5) with one participant for each audience, in order.
std::shared_ptr<XMLCompositeBuilder> BuildParticipants(
    const std::set<std::string>& audienceRestriction);

/// One rsa-advice:Advice with its attributes, in order. The enclosing AdviceSet declares the
/// prefix.
std::shared_ptr<XMLCompositeBuilder> BuildAdvice(const Advice& advice);

/// One rsa-advice:Attribute with its values, in order.
std::shared_ptr<XMLCompositeBuilder> BuildAdviceAttribute(const AdviceAttribute& attribute);

/// wst:BinaryExchange with one leg of an SPNEGO negotiation (WS-Trust 1.3, section 8.3). An
/// enclosing element declares the prefix wst.
std::shared_ptr<XMLBaseBuilder> BuildBinaryExchange(const std::vector<unsigned char>& leg);

}  // namespace SsoClient

#endif
