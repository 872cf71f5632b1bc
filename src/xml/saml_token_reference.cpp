#include "xml/saml_token_reference.h"

#include "xml/builder_factories.h"
#include "xml/namespaces.h"

namespace SsoClient {

namespace {

// "tokenprofile" and "token-profile" are how the profile itself spells the two.
constexpr char kSamlTokenType[] =
    "http://docs.oasis-open.org/wss/oasis-wss-saml-tokenprofile-1.1#SAMLV2.0";
constexpr char kSamlIdValueType[] =
    "http://docs.oasis-open.org/wss/oasis-wss-saml-token-profile-1.1#SAMLID";

}  // namespace

std::shared_ptr<XMLCompositeBuilder> BuildSamlTokenReference(std::string_view assertionId) {
  auto reference = MakeCompositeBuilder("wsse", "SecurityTokenReference",
                                        {{"wsse11:TokenType", kSamlTokenType},
                                         {"xmlns:wsse", kWsseNamespace},
                                         {"xmlns:wsse11", kWsse11Namespace}});
  reference->Add(MakeTextElementBuilder("wsse", "KeyIdentifier", assertionId,
                                        {{"ValueType", kSamlIdValueType}}));
  return reference;
}

}  // namespace SsoClient
