#include "xml/renew_body.h"

#include "token/saml_names.h"
#include "xml/builder_factories.h"
#include "xml/lifetime.h"
#include "xml/namespaces.h"

namespace SsoClient {

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

}  // namespace SsoClient
