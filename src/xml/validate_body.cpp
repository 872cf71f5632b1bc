#include "xml/validate_body.h"

#include "xml/builder_factories.h"
#include "xml/namespaces.h"

namespace SsoClient {

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

}  // namespace SsoClient
