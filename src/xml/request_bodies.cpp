#include "xml/request_bodies.h"

#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/system/date_time.h>
#include <tarnik/text/string_util.h>

#include "deployment.h"
#include "support/namespaces.h"
#include "support/secret_text.h"
#include "xml/security_header.h"
#include "xml/xml_date_time.h"

namespace SsoClient {

std::shared_ptr<XMLCompositeBuilder> BuildLifetime(std::int64_t seconds) {
  constexpr long kMicrosecondsPerSecond = 1'000'000;
  const auto now = Tarnik::System::GetUtcDateTime();
  const long distance = Tarnik::System::SaturatingMultiply(seconds, kMicrosecondsPerSecond);
  const auto expires = Tarnik::System::DateTimeFromUtc(
      Tarnik::System::SaturatingAdd(distance, now.GetUtcTime()), false);

  auto lifetime = MakeCompositeBuilder("wst", "Lifetime", {{"xmlns:wsu", kWsuNamespace}});
  lifetime->Add(MakeTextElementBuilder("wsu", "Created", FormatXmlDateTime(now)))
      .Add(MakeTextElementBuilder("wsu", "Expires", FormatXmlDateTime(expires)));
  return lifetime;
}

namespace {

std::shared_ptr<XMLCompositeBuilder> BuildParticipant(const std::string& audience) {
  auto reference = MakeCompositeBuilder("wsa", "EndpointReference");
  reference->Add(MakeTextElementBuilder("wsa", "Address", audience));
  auto participant = MakeCompositeBuilder("wst", "Participant");
  participant->Add(reference);
  return participant;
}

}  // namespace

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

namespace {

constexpr char kIssueRequestType[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Issue";
constexpr char kPublicKeyType[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/PublicKey";
constexpr char kBearerKeyType[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Bearer";
constexpr unsigned kHolderOfKey = 1;

std::string BooleanText(bool value) {
  return value ? "true" : "false";
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
                                   {"xmlns:saml", std::string(kSamlNamespace)},
                                   {"xmlns:xs", kXmlSchemaNamespace},
                                   {"xmlns:xsi", kXmlSchemaInstanceNamespace}});
  for (const auto& entry : advice) {
    set->Add(BuildAdvice(entry));
  }
  return set;
}

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildIssueBody(unsigned keyType, const TokenSpec& spec) {
  auto body =
      MakeCompositeBuilder("wst", "RequestSecurityToken",
                           {{"xmlns:wst", kWstNamespace}, {"xmlns:wst14", kWst14Namespace}});
  body->Add(MakeTextElementBuilder("wst", "TokenType", kSamlNamespace))
      .Add(MakeTextElementBuilder("wst", "RequestType", kIssueRequestType))
      .Add(MakeTextElementBuilder("wst", "KeyType", keyType != 0 ? kPublicKeyType : kBearerKeyType))
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

namespace {

constexpr char kRenewRequestType[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Renew";

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildRenewBody(const SamlToken& token,
                                                    std::int64_t lifetimeSec) {
  auto target = MakeCompositeBuilder("wst", "RenewTarget");
  target->Add(MakeTokenElementBuilder(token));
  auto body = MakeCompositeBuilder("wst", "RequestSecurityToken", {{"xmlns:wst", kWstNamespace}});
  body->Add(MakeTextElementBuilder("wst", "TokenType", kSamlNamespace))
      .Add(MakeTextElementBuilder("wst", "RequestType", kRenewRequestType))
      .Add(BuildLifetime(lifetimeSec))
      .Add(target);
  return body;
}

namespace {

constexpr char kStatusTokenType[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Status";
constexpr char kValidateRequestType[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/Validate";

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildValidateBody(const SamlToken& token) {
  auto target = MakeCompositeBuilder("wst", "ValidateTarget");
  target->Add(MakeTokenElementBuilder(token));
  auto body = MakeCompositeBuilder("wst", "RequestSecurityToken", {{"xmlns:wst", kWstNamespace}});
  body->Add(MakeTextElementBuilder("wst", "TokenType", kStatusTokenType))
      .Add(MakeTextElementBuilder("wst", "RequestType", kValidateRequestType))
      .Add(target);
  return body;
}

namespace {

constexpr char kSpnegoValueType[] = "http://schemas.xmlsoap.org/ws/2005/02/trust/spnego";

}  // namespace

std::shared_ptr<XMLBaseBuilder> BuildBinaryExchange(const std::vector<unsigned char>& leg) {
  SecretText text;
  text.text = Tarnik::StringUtil::Base64Encode(leg);
  return MakeTextElementBuilder(
      "wst", "BinaryExchange", text.text,
      {{"EncodingType", kBase64BinaryEncoding}, {"ValueType", kSpnegoValueType}});
}

XMLBodyBuilderInitialSPNego::XMLBodyBuilderInitialSPNego(unsigned keyType, TokenSpec spec,
                                                         std::vector<unsigned char> leg)
    : keyType_(keyType), spec_(std::move(spec)), leg_(std::move(leg)) {}

XMLBodyBuilderInitialSPNego::~XMLBodyBuilderInitialSPNego() {
  Tarnik::StringUtil::Cleanse(leg_);
}

void XMLBodyBuilderInitialSPNego::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  const auto body = BuildIssueBodyWithUseKey(keyType_, spec_);
  body->Add(BuildBinaryExchange(leg_));
  body->Build(out);
  out->SetAttribute("Context", "urn:uuid:" + Tarnik::StringUtil::GenerateUuid());
}

XMLBodyBuilderContinuedSPNego::XMLBodyBuilderContinuedSPNego(std::string contextId,
                                                             std::vector<unsigned char> leg)
    : contextId_(std::move(contextId)), leg_(std::move(leg)) {}

XMLBodyBuilderContinuedSPNego::~XMLBodyBuilderContinuedSPNego() {
  Tarnik::StringUtil::Cleanse(leg_);
}

void XMLBodyBuilderContinuedSPNego::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  const auto body = MakeCompositeBuilder("wst", "RequestSecurityTokenResponse");
  body->Add(BuildBinaryExchange(leg_));
  body->Build(out);
  out->SetAttribute("Context", contextId_);
}

}  // namespace SsoClient
