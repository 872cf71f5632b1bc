#include "token_model.h"

#include "token_layout.h"

namespace Fuzz {
namespace {

std::string IssuerOf(const xmlNode* issuer) {
  DemandAttributes(issuer, {}, {"Format"});
  return OnlyTextOf(issuer);
}

// A reference to the whole document or to the assertion covers the assertion.
void DemandCoverage(const xmlNode* signature, const std::string& id) {
  const xmlNode* signedInfo = ChildElement(signature, "SignedInfo");
  Demand(signedInfo != nullptr);
  for (const Item& item : ContentOf(signedInfo)) {
    const bool isReference = item.isElement && LocalNameOf(item.node) == "Reference";
    const auto uri = isReference ? AttributeOf(item.node, "URI") : std::nullopt;
    if (uri && (uri->empty() || *uri == "#" + id)) {
      return;
    }
  }
  throw NotAToken();
}

bool ContainsSaml(const xmlNode* element) {
  for (const Item& item : ContentOf(element)) {
    if (item.isElement && (NamespaceOf(item.node) == kSaml || ContainsSaml(item.node))) {
      return true;
    }
  }
  return false;
}

// What is in KeyInfo is not signed, and must not be taken for an assertion.
void DemandNoHiddenAssertion(const xmlNode* signature) {
  const xmlNode* keyInfo = ChildElement(signature, "KeyInfo");
  Demand(keyInfo == nullptr || !ContainsSaml(keyInfo));
}

ModelToken ReadAssertion(const xmlNode* assertion,
                         const std::function<bool(const xmlNode*)>& isSignature) {
  ModelToken token;
  Demand(LocalNameOf(assertion) == "Assertion" && NamespaceOf(assertion) == kSaml);
  DemandAttributes(assertion, {"Version", "ID", "IssueInstant"});
  token.version = Demanded(AttributeOf(assertion, "Version"));
  token.id = Demanded(AttributeOf(assertion, "ID"));
  DateAttributeOf(assertion, "IssueInstant");
  Contents contents(assertion);
  token.issuer = IssuerOf(contents.Take("Issuer"));
  const xmlNode* signature = contents.TakeAny();
  Demand(isSignature(signature));
  DemandCoverage(signature, token.id);
  DemandNoHiddenAssertion(signature);
  ReadSubject(contents.Take("Subject"), token);
  ReadConditions(contents.Take("Conditions"), token);
  if (contents.IsAt("Advice")) {
    ReadAdvice(contents.TakeAny(), token);
  }
  if (contents.IsAt("AuthnStatement")) {
    ReadAuthnStatement(contents.TakeAny());
  }
  if (contents.IsAt("AttributeStatement")) {
    ReadAttributeStatement(contents.TakeAny(), token);
  }
  contents.DemandEnd();
  return token;
}

void DemandConsistentDelegation(const ModelToken& token) {
  Demand(token.confirmedDelegate.has_value() == token.delegates.has_value());
  if (token.delegates) {
    Demand(!token.delegates->empty() &&
           token.delegates->back().principal == *token.confirmedDelegate);
  }
}

void DemandTimelessRules(const ModelToken& token) {
  Demand(token.version == "2.0");
  Demand(!token.id.empty() && token.id.front() == '_');
  Demand(token.notBefore < token.notOnOrAfter);
  Demand(token.isHolderOfKey || token.confirmedUntil >= token.notOnOrAfter);
  DemandConsistentDelegation(token);
}

}  // namespace

std::optional<ModelToken> ReadToken(const xmlNode* assertion,
                                    const std::function<bool(const xmlNode*)>& isSignature) {
  try {
    ModelToken token = ReadAssertion(assertion, isSignature);
    DemandTimelessRules(token);
    return token;
  } catch (const NotAToken&) {
    return std::nullopt;
  }
}

bool IsCurrent(const ModelToken& token, long now, long tolerance) {
  return token.notBefore - tolerance <= now && token.notOnOrAfter + tolerance > now;
}

}  // namespace Fuzz
