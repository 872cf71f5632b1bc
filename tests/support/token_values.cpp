#include "support/token_values.h"

#include <set>
#include <string>
#include <vector>

#include <ssoclient/principal_id.h>
#include <ssoclient/saml_token.h>

namespace SsoClient::Testing {
namespace {

// Prefixed with its length, so that different lists of values give different texts.
void Add(std::string& text, const std::string& value) {
  text += std::to_string(value.size()) + ":" + value + ";";
}

void AddAdvice(std::string& text, const SamlToken& token) {
  std::vector<Advice> advice;
  token.GetAdvice(advice);
  for (const Advice& block : advice) {
    Add(text, "source " + block.source);
    for (const AdviceAttribute& attribute : block.attributes) {
      Add(text, "name " + attribute.name);
      for (const std::string& value : attribute.values) {
        Add(text, value);
      }
    }
  }
}

void AddPrincipal(std::string& text, const PrincipalId& principal) {
  Add(text, principal.name);
  Add(text, principal.domain);
}

void AddPrincipals(std::string& text, const SamlToken& token) {
  AddPrincipal(text, token.Subject());
  std::vector<PrincipalId> groups;
  token.GetGroups(groups);
  for (const PrincipalId& group : groups) {
    AddPrincipal(text, group);
  }
  std::vector<Delegate> chain;
  token.GetDelegationChain(chain);
  for (const Delegate& delegate : chain) {
    AddPrincipal(text, delegate.delegate);
    Add(text, delegate.delegationInstant.ToString());
  }
}

}  // namespace

std::string AllValues(const SamlToken& token) {
  std::string text = CreateSamlTokenDescription(token);
  Add(text, token.Id());
  Add(text, token.Issuer());
  Add(text, token.StartTime().ToString());
  Add(text, token.ExpirationTime().ToString());
  SubjectNames names;
  token.GetSubjectNames(names);
  Add(text, names.givenName);
  Add(text, names.surname);
  AddPrincipals(text, token);
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  for (const std::string& audience : audiences) {
    Add(text, audience);
  }
  AddAdvice(text, token);
  if (const auto certificate = token.HolderOfKeyCertificate()) {
    Add(text, std::string(reinterpret_cast<const char*>(certificate->DerBytes()),
                          certificate->DerLength()));
  }
  return text;
}

}  // namespace SsoClient::Testing
