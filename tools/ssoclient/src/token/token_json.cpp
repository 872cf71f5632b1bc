#include "token/token_json.h"

#include <set>
#include <string>
#include <vector>

#include "output/duration_text.h"
#include "token/confirmation_name.h"
#include "token/unverified_token.h"
#include "token/validity.h"

namespace SsoClient::Tool {
namespace {

using Json = nlohmann::json;
using Tarnik::System::DateTime;

Json PrincipalJson(const PrincipalId& principal) {
  return {{"name", principal.name}, {"domain", principal.domain}};
}

Json NamesJson(const SamlToken& token) {
  SubjectNames names;
  token.GetSubjectNames(names);
  Json json = Json::object();
  if (!names.givenName.empty()) {
    json["givenName"] = names.givenName;
  }
  if (!names.surname.empty()) {
    json["surname"] = names.surname;
  }
  return json;
}

Json GroupsJson(const SamlToken& token) {
  std::vector<PrincipalId> groups;
  token.GetGroups(groups);
  Json json = Json::array();
  for (const PrincipalId& group : groups) {
    json.push_back(PrincipalJson(group));
  }
  return json;
}

Json ChainJson(const SamlToken& token) {
  std::vector<Delegate> chain;
  token.GetDelegationChain(chain);
  Json json = Json::array();
  for (const Delegate& each : chain) {
    Json delegate = PrincipalJson(each.delegate);
    delegate["since"] = each.delegationInstant.ToString();
    json.push_back(delegate);
  }
  return json;
}

Json AudiencesJson(const SamlToken& token) {
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  return audiences;
}

Json AdviceJson(const SamlToken& token) {
  std::vector<Advice> advice;
  token.GetAdvice(advice);
  Json json = Json::array();
  for (const Advice& each : advice) {
    Json attributes = Json::array();
    for (const AdviceAttribute& attribute : each.attributes) {
      attributes.push_back({{"name", attribute.name}, {"values", attribute.values}});
    }
    json.push_back({{"source", each.source}, {"attributes", attributes}});
  }
  return json;
}

void AddValidity(const SamlToken& token, const DateTime& now, Json& json) {
  const Validity validity{token.StartTime(), token.ExpirationTime(), now};
  json["notBefore"] = validity.start.ToString();
  json["notOnOrAfter"] = validity.end.ToString();
  json["lifetime"] = SecondsBetween(validity.start, validity.end).count();
  json["now"] = now.ToString();
  json["state"] = validity.StateName();
  json["elapsedPercent"] = validity.Percent();
  // Negative after the end.
  json["remaining"] = SecondsBetween(now, validity.end).count();
}

void AddKeys(const SamlToken& token, Json& json) {
  const auto holder = token.HolderOfKeyCertificate();
  json["confirmation"] = ConfirmationName(token.ConfirmationType());
  if (holder != nullptr) {
    json["holder"] = CertificateJson(*holder);
  }
  json["signatureAlgorithm"] = token.GetSignature()->SignatureMethod();
  if (const auto signer = ClaimedSigner(token); signer != nullptr) {
    json["signer"] = CertificateJson(*signer);
  }
}

}  // namespace

Json CertificateJson(const Tarnik::Crypto::Certificate& certificate) {
  return {{"subject", certificate.SubjectName()},
          {"issuer", certificate.IssuerName()},
          {"serialNumber", certificate.SerialNumber()},
          {"sha256", Tarnik::Crypto::FingerprintText(certificate)},
          {"notBefore", certificate.NotBefore().ToString()},
          {"notAfter", certificate.NotAfter().ToString()}};
}

Json TokenJson(const SamlToken& token, const DateTime& now) {
  Json json = {{"id", token.Id()},
               {"issuer", token.Issuer()},
               {"subject", PrincipalJson(token.Subject())},
               {"names", NamesJson(token)},
               {"groups", GroupsJson(token)},
               {"audiences", AudiencesJson(token)},
               {"delegationChain", ChainJson(token)},
               {"advice", AdviceJson(token)},
               {"isRenewable", token.IsRenewable()},
               {"isDelegable", token.IsDelegable()},
               {"isSolution", token.IsSolution()}};
  AddKeys(token, json);
  AddValidity(token, now, json);
  return json;
}

}  // namespace SsoClient::Tool
