#include "request_model.h"

#include <algorithm>
#include <cstdio>
#include <ctime>
#include <limits>
#include <utility>

#include "deployment.h"
#include "fixed_clock.h"
#include "value_model.h"

namespace Fuzz {
namespace {

const std::string kSoap = "http://schemas.xmlsoap.org/soap/envelope/";
const std::string kWst = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
const std::string kWst14 = "http://docs.oasis-open.org/ws-sx/ws-trust/200802";
const std::string kWsa = "http://www.w3.org/2005/08/addressing";
const std::string kDs = "http://www.w3.org/2000/09/xmldsig#";
const std::string kOasis = "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-";
const std::string kWsse = kOasis + "wssecurity-secext-1.0.xsd";
const std::string kWsu = kOasis + "wssecurity-utility-1.0.xsd";
const std::string kBase64 = kOasis + "soap-message-security-1.0#Base64Binary";
const std::string kX509 = kOasis + "x509-token-profile-1.0#X509v3";
const std::string kSaml = "urn:oasis:names:tc:SAML:2.0:assertion";
const std::string kAdvice = SsoClient::kVendorAdviceNamespace;
const std::string kWsse11 =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.1.xsd";
const std::string kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";

constexpr long kSecond = 1'000'000;

std::string TimeText(long microseconds) {
  const long limit = 253'402'300'800 * kSecond - 1;  // the end of the year 9999
  const long shown = std::min(microseconds, limit);
  const std::time_t seconds = shown / kSecond;
  std::tm fields{};
  gmtime_r(&seconds, &fields);
  char text[64];
  std::snprintf(text, sizeof(text), "%04d-%02d-%02dT%02d:%02d:%02d.%03dZ", fields.tm_year + 1900,
                fields.tm_mon + 1, fields.tm_mday, fields.tm_hour, fields.tm_min, fields.tm_sec,
                static_cast<int>(shown % kSecond / 1000));
  return text;
}

long After(long now, std::int64_t seconds) {
  long distance = 0;
  long sum = 0;
  return __builtin_mul_overflow(seconds, kSecond, &distance) ||
                 __builtin_add_overflow(now, distance, &sum)
             ? std::numeric_limits<long>::max()
             : sum;
}

Element Text(const std::string& uri, const std::string& name, const std::string& text) {
  return {uri, name, {}, text};
}

Element Parent(const std::string& uri, const std::string& name, std::vector<Element> children) {
  return {uri, name, {}, {}, std::move(children)};
}

Element Lifetime(const RequestCase& request, const std::string& uri, const std::string& name,
                 std::int64_t seconds) {
  return Parent(uri, name,
                {Text(kWsu, "Created", TimeText(request.now)),
                 Text(kWsu, "Expires", TimeText(After(request.now, seconds)))});
}

Element Leg(const RequestCase& request) {
  return {kWst,
          "BinaryExchange",
          {{"EncodingType", kBase64},
           {"ValueType", "http://schemas.xmlsoap.org/ws/2005/02/trust/spnego"}},
          Base64Of(request.leg)};
}

Element Participants(const std::set<std::string>& audiences) {
  Element participants{kWst, "Participants"};
  for (const std::string& audience : audiences) {
    participants.children.push_back(
        Parent(kWst, "Participant",
               {Parent(kWsa, "EndpointReference", {Text(kWsa, "Address", audience)})}));
  }
  return participants;
}

Element AdviceSet(const std::vector<SsoClient::Advice>& all) {
  Element set{kAdvice, "AdviceSet"};
  for (const auto& advice : all) {
    Element element{kAdvice, "Advice", {{"AdviceSource", advice.source}}};
    for (const auto& attribute : advice.attributes) {
      Element child{kAdvice, "Attribute", {{"Name", attribute.name}}};
      for (const std::string& value : attribute.values) {
        child.children.push_back(
            {kAdvice,
             "AttributeValue",
             {{"{http://www.w3.org/2001/XMLSchema-instance}type", "xs:string"}},
             value});
      }
      element.children.push_back(child);
    }
    set.children.push_back(element);
  }
  return set;
}

Element TokenOf(const std::string& text) {
  return ReadWithLibXml2(text).value();
}

Element IssueBody(const RequestCase& request) {
  const auto& spec = request.spec;
  const auto boolean = [](bool value) { return value ? "true" : "false"; };
  Element body =
      Parent(kWst, "RequestSecurityToken",
             {Text(kWst, "TokenType", kSaml),
              Text(kWst, "RequestType", kWst + "/Issue"),
              Text(kWst, "KeyType", kWst + (request.IsForKey() ? "/PublicKey" : "/Bearer")),
              Lifetime(request, kWst, "Lifetime", spec.tokenLifetimeSec),
              {kWst, "Renewing", {{"Allow", boolean(spec.renewable)}, {"OK", "false"}}},
              Text(kWst, "Delegatable", boolean(spec.delegable))});
  const auto add = [&body](Element child) { body.children.push_back(std::move(child)); };
  if (spec.delegateTo) {
    add(Parent(kWst, "DelegateTo",
               {Parent(kWsse, "UsernameToken", {Text(kWsse, "Username", *spec.delegateTo)})}));
  }
  if (spec.actAsToken) {
    add(Parent(kWst14, "ActAs", {TokenOf(request.actAs)}));
  }
  if (!spec.audienceRestriction.empty()) {
    add(Participants(spec.audienceRestriction));
  }
  if (!spec.advice.empty()) {
    add(AdviceSet(spec.advice));
  }
  if (request.IsForKey() && !spec.delegateTo && request.operation != Operation::kToken) {
    add({kWst, "UseKey", {{"Sig", "holderOfKeyProofSignature"}}});
  }
  if (request.operation == Operation::kFirstLeg) {
    add(Leg(request));
    body.attributes["Context"] = "urn:uuid:" + kFixedUuid;
  }
  return body;
}

Element RequestBody(const RequestCase& request) {
  switch (request.operation) {
    case Operation::kNextLeg: {
      Element body = Parent(kWst, "RequestSecurityTokenResponse", {Leg(request)});
      body.attributes["Context"] = request.contextId;
      return body;
    }
    case Operation::kValidate:
      return Parent(kWst, "RequestSecurityToken",
                    {Text(kWst, "TokenType", kWst + "/RSTR/Status"),
                     Text(kWst, "RequestType", kWst + "/Validate"),
                     Parent(kWst, "ValidateTarget", {TokenOf(request.token)})});
    case Operation::kRenew:
      return Parent(kWst, "RequestSecurityToken",
                    {Text(kWst, "TokenType", kSaml), Text(kWst, "RequestType", kWst + "/Renew"),
                     Lifetime(request, kWst, "Lifetime", request.spec.tokenLifetimeSec),
                     Parent(kWst, "RenewTarget", {TokenOf(request.token)})});
    default:
      return IssueBody(request);
  }
}

Element Algorithm(const std::string& name, const std::string& uri) {
  return {kDs, name, {{"Algorithm", uri}}};
}

Element Reference(const std::string& name) {
  return {kDs,
          "Reference",
          {{"URI", "#" + name + kFixedUuid}},
          {},
          {Parent(kDs, "Transforms", {Algorithm("Transform", kExclusive)}),
           Algorithm("DigestMethod", "http://www.w3.org/2001/04/xmlenc#sha256"),
           Text(kDs, "DigestValue", "")}};
}

Element KeyReference(const RequestCase& request) {
  if (request.operation != Operation::kToken) {
    return Parent(
        kWsse, "SecurityTokenReference",
        {{kWsse, "Reference", {{"URI", "#holderOfKeyCertificate"}, {"ValueType", kX509}}}});
  }
  const std::string profile = "http://docs.oasis-open.org/wss/oasis-wss-saml-token";
  Element reference = Parent(kWsse, "SecurityTokenReference",
                             {{kWsse,
                               "KeyIdentifier",
                               {{"ValueType", profile + "-profile-1.1#SAMLID"}},
                               request.tokenId}});
  reference.attributes["{" + kWsse11 + "}TokenType"] = profile + "profile-1.1#SAMLV2.0";
  return reference;
}

Element Signature(const RequestCase& request) {
  const Element signedInfo =
      Parent(kDs, "SignedInfo",
             {Algorithm("CanonicalizationMethod", kExclusive),
              Algorithm("SignatureMethod", "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256"),
              Reference("Body"), Reference("Timestamp")});
  return {kDs,
          "Signature",
          {{"Id", "holderOfKeyProofSignature"}},
          {},
          {signedInfo, Text(kDs, "SignatureValue", ""),
           Parent(kDs, "KeyInfo", {KeyReference(request)})}};
}

Element Security(const RequestCase& request) {
  constexpr std::int64_t kTimestampSeconds = 600;
  Element security =
      Parent(kWsse, "Security", {Lifetime(request, kWsu, "Timestamp", kTimestampSeconds)});
  if (request.operation == Operation::kPassword) {
    security.children.push_back(
        Parent(kWsse, "UsernameToken",
               {Text(kWsse, "Username", request.userName),
                {kWsse,
                 "Password",
                 {{"Type", kOasis + "username-token-profile-1.0#PasswordText"}},
                 request.password}}));
  }
  if (request.operation == Operation::kToken) {
    security.children.push_back(TokenOf(request.token));
  } else if (request.IsSigned()) {
    security.children.push_back({kWsse,
                                 "BinarySecurityToken",
                                 {{"EncodingType", kBase64},
                                  {"ValueType", kX509},
                                  {"{" + kWsu + "}Id", "holderOfKeyCertificate"}},
                                 request.certificate});
  }
  return security;
}

}  // namespace

bool RequestCase::SendsSpec() const {
  return operation != Operation::kNextLeg && operation != Operation::kValidate &&
         operation != Operation::kRenew;
}

bool RequestCase::IsForKey() const {
  return HasKey() && spec.confirmation == SsoClient::CONFIRMATION_DEFAULT;
}

bool RequestCase::IsSigned() const {
  switch (operation) {
    case Operation::kPassword:
    case Operation::kFirstLeg:
      return IsForKey() && !spec.actAsToken;
    case Operation::kCertificate:
      return true;
    case Operation::kToken:
    case Operation::kRenew:
      return true;
    default:
      return false;
  }
}

Element ExpectedRequest(const RequestCase& request) {
  Element body = Parent(kSoap, "Body", {RequestBody(request)});
  Element security = Security(request);
  if (request.IsSigned()) {
    body.attributes["{" + kWsu + "}Id"] = "Body" + kFixedUuid;
    security.children.front().attributes["{" + kWsu + "}Id"] = "Timestamp" + kFixedUuid;
    security.children.push_back(Signature(request));
  }
  return Parent(kSoap, "Envelope", {Parent(kSoap, "Header", {security}), body});
}

Element WithoutValues(Element element) {
  if (element.namespaceUri == kDs &&
      (element.name == "DigestValue" || element.name == "SignatureValue")) {
    element.text.clear();
  }
  for (Element& child : element.children) {
    child = WithoutValues(std::move(child));
  }
  return element;
}

}  // namespace Fuzz
