#include "xml/username_token.h"

#include "xml/builder_factories.h"
#include "xml/namespaces.h"

namespace SsoClient {

namespace {

constexpr char kPasswordTextType[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-username-token-profile-1.0#PasswordText";

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildUsernameToken(std::string_view user) {
  auto token = MakeCompositeBuilder("wsse", "UsernameToken", {{"xmlns:wsse", kWsseNamespace}});
  token->Add(MakeTextElementBuilder("wsse", "Username", user));
  return token;
}

std::shared_ptr<XMLCompositeBuilder> BuildUsernamePasswordToken(std::string_view user,
                                                                std::string_view password) {
  auto token = BuildUsernameToken(user);
  token->Add(MakeTextElementBuilder("wsse", "Password", password, {{"Type", kPasswordTextType}}));
  return token;
}

}  // namespace SsoClient
