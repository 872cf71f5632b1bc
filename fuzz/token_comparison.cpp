#include "token_comparison.h"

#include <algorithm>
#include <set>
#include <vector>

#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "input.h"
#include "signature_model.h"
#include "value_model.h"
#include "xml_tree.h"

namespace Fuzz {
namespace {

using namespace Tarnik;

bool IsSame(const SsoClient::PrincipalId& id, const ModelPrincipal& model) {
  return id.name == model.name && id.domain == model.domain;
}

bool IsSame(const SsoClient::Delegate& delegate, const ModelDelegate& model) {
  return IsSame(delegate.delegate, model.principal) &&
         delegate.delegationInstant.GetUtcTime() == model.instant;
}

bool IsSame(const SsoClient::AdviceAttribute& attribute, const ModelAttribute& model) {
  return attribute.name == model.name && attribute.values == model.values;
}

template <class Values, class Models>
bool AreSame(const Values& values, const Models& models);

bool IsSame(const SsoClient::Advice& advice, const ModelAdvice& model) {
  return advice.source == model.source && AreSame(advice.attributes, model.attributes);
}

template <class Values, class Models>
bool AreSame(const Values& values, const Models& models) {
  return std::equal(values.begin(), values.end(), models.begin(), models.end(),
                    [](const auto& value, const auto& model) { return IsSame(value, model); });
}

// Public comparisons of principals ignore letter case (ASCII), those of the delegation do not.
void RequireComparable(const SsoClient::PrincipalId& id) {
  const SsoClient::PrincipalId lower{LowerCaseOf(id.name), LowerCaseOf(id.domain)};
  Require(id == id && id == lower && lower == id);
  Require(!(id == SsoClient::PrincipalId{id.name + "x", id.domain}));
  Require(!(id == SsoClient::PrincipalId{id.name, id.domain + "x"}));
}

void RequireLists(const SsoClient::SamlToken& token, const ModelToken& model) {
  std::vector<SsoClient::PrincipalId> groups;
  token.GetGroups(groups);
  Require(AreSame(groups, model.groups));
  std::vector<SsoClient::Delegate> chain;
  token.GetDelegationChain(chain);
  Require(AreSame(chain, model.delegates.value_or(std::vector<ModelDelegate>())));
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  Require(audiences == model.audiences);
  std::vector<SsoClient::Advice> advice;
  token.GetAdvice(advice);
  Require(AreSame(advice, model.advice));
}

std::vector<unsigned char> BytesOf(const Ref<const Crypto::Certificate>& certificate) {
  if (certificate == nullptr) {
    return {};
  }
  return {certificate->DerBytes(), certificate->DerBytes() + certificate->DerLength()};
}

// The second element in the assertion: before it, the layout has only the issuer.
Xml::ElementNode* SignatureOf(const Xml::Document& document) {
  int elements = 0;
  for (Xml::Node* node = document.RootElement()->FirstChild(); node != nullptr;
       node = node->NextSibling()) {
    if (node->Kind() == Xml::NodeKind::kElement && ++elements == 2) {
      return static_cast<Xml::ElementNode*>(node);
    }
  }
  return nullptr;
}

bool IsReadAsSignature(const Xml::Document& document) {
  try {
    Xml::Security::CreateSignatureFromDom(SignatureOf(document));
    return true;
  } catch (const Xml::Security::SignatureSyntaxException&) {
    return false;
  }
}

bool IsSignature(const xmlNode* element, const Xml::Document& document) {
  const bool isRead = IsReadAsSignature(document);
  const bool isShaped = IsSignatureShaped(element);
  Require(isShaped || !isRead);
  Require(isRead || !isShaped || ChildElement(element, "KeyInfo") != nullptr);
  return isRead;
}

}  // namespace

std::optional<ModelToken> ReadByModel(const std::string& text, const Xml::Document& document) {
  const XmlTree tree = ParseByLibXml2(text);
  Require(tree != nullptr);
  return ReadToken(xmlDocGetRootElement(tree.get()),
                   [&document](const xmlNode* element) { return IsSignature(element, document); });
}

void RequireValues(const SsoClient::SamlToken& token, const ModelToken& model) {
  Require(token.Id() == model.id && token.Issuer() == model.issuer);
  Require(token.StartTime().GetUtcTime() == model.notBefore);
  Require(token.ExpirationTime().GetUtcTime() == model.notOnOrAfter);
  Require(IsSame(token.Subject(), model.subject));
  RequireComparable(token.Subject());
  Require(token.IsRenewable() == (model.renewals != 0));
  Require(token.IsDelegable() == (model.proxies != 0));
  Require(token.IsSolution() == model.isSolution);
  Require(token.ConfirmationType() ==
          (model.isHolderOfKey ? SsoClient::HOLDER_OF_KEY : SsoClient::BEARER));
  Require(BytesOf(token.HolderOfKeyCertificate()) == model.certificate);
  SsoClient::SubjectNames names;
  token.GetSubjectNames(names);
  Require(names.givenName == model.givenName && names.surname == model.surname);
  RequireLists(token, model);
}

}  // namespace Fuzz
