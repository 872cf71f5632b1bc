#include "xml/issue_body.h"

#include <string>

#include <tarnik/core/exception.h>

#include "deployment.h"
#include "token/saml_names.h"
#include "xml/advice_builders.h"
#include "xml/builder_factories.h"
#include "xml/lifetime.h"
#include "xml/namespaces.h"
#include "xml/participants.h"
#include "xml/username_token.h"

namespace SsoClient {

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

}  // namespace SsoClient
