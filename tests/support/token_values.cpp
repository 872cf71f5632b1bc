#include "support/token_values.h"

#include <tarnik/crypto/certificate.h>

#include <set>
#include <vector>

namespace TestSupport {
namespace {

using SsoClient::SamlToken;

// With its length in front, so that no two lists of values give one text.
void Add(std::string& text, const std::string& value) {
  text += std::to_string(value.size()) + ":" + value + ";";
}

void AddAdvice(std::string& text, const SamlToken& token) {
  std::vector<SsoClient::Advice> advice;
  token.GetAdvice(advice);
  for (const SsoClient::Advice& block : advice) {
    Add(text, "source " + block.source);
    for (const SsoClient::AdviceAttribute& attribute : block.attributes) {
      Add(text, "name " + attribute.name);
      for (const std::string& value : attribute.values) {
        Add(text, value);
      }
    }
  }
}

void AddPrincipal(std::string& text, const SsoClient::PrincipalId& principal) {
  Add(text, principal.name);
  Add(text, principal.domain);
}

void AddPrincipals(std::string& text, const SamlToken& token) {
  AddPrincipal(text, token.Subject());
  std::vector<SsoClient::PrincipalId> groups;
  token.GetGroups(groups);
  for (const SsoClient::PrincipalId& group : groups) {
    AddPrincipal(text, group);
  }
  std::vector<SsoClient::Delegate> chain;
  token.GetDelegationChain(chain);
  for (const SsoClient::Delegate& delegate : chain) {
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
  SsoClient::SubjectNames names;
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

}  // namespace TestSupport
