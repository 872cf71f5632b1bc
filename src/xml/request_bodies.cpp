#include "xml/request_bodies.h"

#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/text/string_util.h>

#include "deployment.h"
#include "support/clock_tolerance.h"
#include "support/namespaces.h"
#include "xml/security_header.h"
#include "xml/ws_trust_names.h"
#include "xml/xml_date_time.h"

namespace SsoClient {

namespace {

constexpr unsigned kHolderOfKey = 1;
constexpr char kSpnegoValueType[] = "http://schemas.xmlsoap.org/ws/2005/02/trust/spnego";

std::string BooleanText(bool value) {
  return value ? "true" : "false";
}

std::shared_ptr<XMLCompositeBuilder> BuildParticipant(const std::string& audience) {
  auto reference = MakeCompositeBuilder("wsa", "EndpointReference");
  reference->Add(MakeTextElementBuilder("wsa", "Address", audience));
  auto participant = MakeCompositeBuilder("wst", "Participant");
  participant->Add(reference);
  return participant;
}

std::shared_ptr<XMLBaseBuilder> BuildDelegateTo(const boost::optional<std::string>& delegateTo) {
  if (!delegateTo) {
    return nullptr;
  }
  auto element = MakeCompositeBuilder("wst", "DelegateTo");
  element->Add(BuildUsernameToken(*delegateTo));
  return element;
}

std::shared_ptr<XMLBaseBuilder> BuildActAs(
    const boost::optional<std::shared_ptr<const SamlToken>>& actAsToken) {
  if (!actAsToken) {
    return nullptr;
  }
  if (*actAsToken == nullptr) {
    throw Tarnik::InvalidArgumentException("TokenSpec::actAsToken is set, but holds no token");
  }
  auto element = MakeCompositeBuilder("wst14", "ActAs");
  element->Add(MakeTokenElementBuilder(**actAsToken));
  return element;
}

std::shared_ptr<XMLBaseBuilder> BuildAudiences(const std::set<std::string>& audienceRestriction) {
  if (audienceRestriction.empty()) {
    return nullptr;
  }
  return BuildParticipants(audienceRestriction);
}

std::shared_ptr<XMLBaseBuilder> BuildAdviceSet(const std::vector<Advice>& advice) {
  if (advice.empty()) {
    return nullptr;
  }
  auto set = MakeCompositeBuilder("rsa-advice", "AdviceSet",
                                  {{"xmlns:rsa-advice", kVendorAdviceNamespace},
                                   {"xmlns:saml", kSamlNamespace},
                                   {"xmlns:xs", kXsNamespace},
                                   {"xmlns:xsi", kXsiNamespace}});
  for (const auto& entry : advice) {
    set->Add(BuildAdvice(entry));
  }
  return set;
}

// The element `targetName` with `token` as its child.
std::shared_ptr<XMLCompositeBuilder> BuildTarget(const char* targetName, const SamlToken& token) {
  auto target = MakeCompositeBuilder("wst", targetName);
  target->Add(MakeTokenElementBuilder(token));
  return target;
}

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildIssueBody(unsigned keyType, const TokenSpec& spec) {
  auto body = MakeCompositeBuilder(
      "wst", "RequestSecurityToken",
      {{"xmlns:wst", kWsTrust13.namespaceUri}, {"xmlns:wst14", kWst14Namespace}});
  body->Add(MakeTextElementBuilder("wst", "TokenType", kSamlNamespace))
      .Add(MakeTextElementBuilder("wst", "RequestType", kWsTrust13.issueRequestType))
      .Add(MakeTextElementBuilder(
          "wst", "KeyType", keyType != 0 ? kWsTrust13.publicKeyType : kWsTrust13.bearerKeyType))
      .Add(BuildLifetime(spec.tokenLifetimeSec))
      .Add(MakeElementBuilder("wst", "Renewing",
                              {{"Allow", BooleanText(spec.renewable)}, {"OK", "false"}}))
      .Add(MakeTextElementBuilder("wst", "Delegatable", BooleanText(spec.delegable)))
      .Add(BuildDelegateTo(spec.delegateTo))
      .Add(BuildActAs(spec.actAsToken))
      .Add(BuildAudiences(spec.audienceRestriction))
      .Add(BuildAdviceSet(spec.advice));
  return body;
}

std::shared_ptr<XMLCompositeBuilder> BuildIssueBodyWithUseKey(unsigned keyType,
                                                              const TokenSpec& spec) {
  auto body = BuildIssueBody(keyType, spec);
  if (keyType == kHolderOfKey && !spec.delegateTo) {
    body->Add(MakeElementBuilder("wst", "UseKey", {{"Sig", kProofSignatureId}}));
  }
  return body;
}

std::shared_ptr<XMLCompositeBuilder> BuildRenewBody(const SamlToken& token,
                                                    std::int64_t lifetimeSec) {
  auto target = BuildTarget("RenewTarget", token);
  auto body =
      MakeCompositeBuilder("wst", "RequestSecurityToken", {{"xmlns:wst", kWsTrust13.namespaceUri}});
  body->Add(MakeTextElementBuilder("wst", "TokenType", kSamlNamespace))
      .Add(MakeTextElementBuilder("wst", "RequestType", kWsTrust13.renewRequestType))
      .Add(BuildLifetime(lifetimeSec))
      .Add(target);
  return body;
}

std::shared_ptr<XMLCompositeBuilder> BuildValidateBody(const SamlToken& token) {
  auto target = BuildTarget("ValidateTarget", token);
  auto body =
      MakeCompositeBuilder("wst", "RequestSecurityToken", {{"xmlns:wst", kWsTrust13.namespaceUri}});
  body->Add(MakeTextElementBuilder("wst", "TokenType", kWsTrust13.statusTokenType))
      .Add(MakeTextElementBuilder("wst", "RequestType", kWsTrust13.validateRequestType))
      .Add(target);
  return body;
}

XMLBodyBuilderInitialSPNego::XMLBodyBuilderInitialSPNego(unsigned keyType, TokenSpec spec,
                                                         std::vector<unsigned char> leg)
    : keyType_(keyType), spec_(std::move(spec)), leg_(std::move(leg)) {}

void XMLBodyBuilderInitialSPNego::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  const auto body = BuildIssueBodyWithUseKey(keyType_, spec_);
  body->Add(BuildBinaryExchange(leg_.bytes));
  body->Build(out);
  out->SetAttribute("Context", "urn:uuid:" + Tarnik::StringUtil::GenerateUuid());
}

XMLBodyBuilderContinuedSPNego::XMLBodyBuilderContinuedSPNego(std::string contextId,
                                                             std::vector<unsigned char> leg)
    : contextId_(std::move(contextId)), leg_(std::move(leg)) {}

void XMLBodyBuilderContinuedSPNego::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  const auto body = MakeCompositeBuilder("wst", "RequestSecurityTokenResponse");
  body->Add(BuildBinaryExchange(leg_.bytes));
  body->Build(out);
  out->SetAttribute("Context", contextId_);
}

std::shared_ptr<XMLCompositeBuilder> BuildLifetime(std::int64_t seconds) {
  const auto now = Tarnik::System::GetUtcDateTime();
  auto lifetime = MakeCompositeBuilder("wst", "Lifetime", {{"xmlns:wsu", kWsuNamespace}});
  AddCreatedAndExpires(*lifetime, now, AddSeconds(now, seconds));
  return lifetime;
}

std::shared_ptr<XMLCompositeBuilder> BuildParticipants(
    const std::set<std::string>& audienceRestriction) {
  auto participants = MakeCompositeBuilder("wst", "Participants", {{"xmlns:wsa", kWsaNamespace}});
  for (const auto& audience : audienceRestriction) {
    participants->Add(BuildParticipant(audience));
  }
  return participants;
}

std::shared_ptr<XMLCompositeBuilder> BuildAdvice(const Advice& advice) {
  auto builder = MakeCompositeBuilder("rsa-advice", "Advice", {{"AdviceSource", advice.source}});
  for (const auto& attribute : advice.attributes) {
    builder->Add(BuildAdviceAttribute(attribute));
  }
  return builder;
}

std::shared_ptr<XMLCompositeBuilder> BuildAdviceAttribute(const AdviceAttribute& attribute) {
  auto builder = MakeCompositeBuilder("rsa-advice", "Attribute", {{"Name", attribute.name}});
  for (const auto& value : attribute.values) {
    builder->Add(
        MakeTextElementBuilder("rsa-advice", "AttributeValue", value, {{"xsi:type", "xs:string"}}));
  }
  return builder;
}

std::shared_ptr<XMLBaseBuilder> BuildBinaryExchange(const std::vector<unsigned char>& leg) {
  SecretText text;
  text.text = Tarnik::StringUtil::Base64Encode(leg);
  return MakeTextElementBuilder(
      "wst", "BinaryExchange", text.text,
      {{"EncodingType", kBase64BinaryEncoding}, {"ValueType", kSpnegoValueType}});
}

}  // namespace SsoClient
