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

#include "xml/builders.h"

namespace SsoClient {

/// wst:Lifetime (WS-Trust 1.3, section 4.1) from now on for `seconds`, which is not judged here.
std::shared_ptr<XMLCompositeBuilder> BuildLifetime(std::int64_t seconds);

/// wst:Participants (WS-Trust 1.3, section 9.5) with one participant for each audience, in order.
std::shared_ptr<XMLCompositeBuilder> BuildParticipants(
    const std::set<std::string>& audienceRestriction);

/// One rsa-advice:Advice with its attributes, in order. The prefix is declared by the AdviceSet
/// around it.
std::shared_ptr<XMLCompositeBuilder> BuildAdvice(const Advice& advice);

/// One rsa-advice:Attribute with its values, in order.
std::shared_ptr<XMLCompositeBuilder> BuildAdviceAttribute(const AdviceAttribute& attribute);

/// wst:RequestSecurityToken that asks for a token (WS-Trust 1.3, section 4.1; ActAs as in WS-Trust
/// 1.4, section 9.3). `keyType` 0 asks for a bearer token, anything else for a holder-of-key one.
///
/// Throws `Tarnik::InvalidArgumentException` when the spec's act-as token is set but null, and
/// `Tarnik::Xml::XMLParseException` when that token's text is malformed.
std::shared_ptr<XMLCompositeBuilder> BuildIssueBody(unsigned keyType, const TokenSpec& spec);

/// The same, with a last wst:UseKey that names the request's signature as proof of possession
/// (WS-Trust 1.3, section 9.2) when `keyType` is 1 and the token is not to be delegated.
std::shared_ptr<XMLCompositeBuilder> BuildIssueBodyWithUseKey(unsigned keyType,
                                                              const TokenSpec& spec);

/// wst:RequestSecurityToken that asks for `token` with a new lifetime of `lifetimeSec` seconds from
/// now on (WS-Trust 1.3, section 5). Throws `Tarnik::Xml::XMLParseException` when the token's text
/// is malformed.
std::shared_ptr<XMLCompositeBuilder> BuildRenewBody(const SamlToken& token,
                                                    std::int64_t lifetimeSec);

/// wst:RequestSecurityToken that asks for the status of `token` (WS-Trust 1.3, section 7). Throws
/// `Tarnik::Xml::XMLParseException` when the token's text is malformed.
std::shared_ptr<XMLCompositeBuilder> BuildValidateBody(const SamlToken& token);

/// wst:BinaryExchange with one leg of an SPNego negotiation (WS-Trust 1.3, section 8.3). The prefix
/// wst is declared by an element around it.
std::shared_ptr<XMLBaseBuilder> BuildBinaryExchange(const std::vector<unsigned char>& leg);

/// The request that opens an SPNego negotiation (WS-Trust 1.3, section 8): asks for a token and
/// carries the first leg. Each build draws a new context id. The leg, which logs
/// its maker in, is cleansed from memory when the builder dies.
class XMLBodyBuilderInitialSPNego final : public XMLBaseBuilder {
 public:
  /// `keyType` as for `BuildIssueBody`.
  XMLBodyBuilderInitialSPNego(unsigned keyType, TokenSpec spec, std::vector<unsigned char> leg);
  ~XMLBodyBuilderInitialSPNego() override;

  /// Throws as `BuildIssueBody` does.
  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  unsigned keyType_;
  TokenSpec spec_;
  std::vector<unsigned char> leg_;
};

/// A later leg of an SPNego negotiation (WS-Trust 1.3, section 8). The prefix wst is declared by an
/// element around it. The leg, which logs its maker in, is cleansed from memory when the builder
/// dies.
class XMLBodyBuilderContinuedSPNego final : public XMLBaseBuilder {
 public:
  /// `contextId` is the one that the service gave the negotiation.
  XMLBodyBuilderContinuedSPNego(std::string contextId, std::vector<unsigned char> leg);
  ~XMLBodyBuilderContinuedSPNego() override;

  void Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const override;

 private:
  std::string contextId_;
  std::vector<unsigned char> leg_;
};

}  // namespace SsoClient

#endif
