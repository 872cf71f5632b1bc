#include "request_text.h"

#include <array>
#include <ctime>
#include <stdexcept>

namespace DevSts::Testing {
namespace {

constexpr char kWsse[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
constexpr char kWsu[] =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";
constexpr char kPasswordText[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-username-token-profile-1.0#PasswordText";

constexpr char kSoap[] = "http://schemas.xmlsoap.org/soap/envelope/";
constexpr char kTrust[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
constexpr char kTrust14[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200802";
constexpr char kSaml[] = "urn:oasis:names:tc:SAML:2.0:assertion";

std::string Period(const std::string& element, long created, long expires) {
  return "<" + element + " xmlns:wsu=\"" + kWsu + "\"><wsu:Created>" + TimeFromNow(created) +
         "</wsu:Created><wsu:Expires>" + TimeFromNow(expires) + "</wsu:Expires></" + element + ">";
}

std::string Leaf(const std::string& name, const std::string& text) {
  return "<wst:" + name + ">" + text + "</wst:" + name + ">";
}

std::string Request(const std::string& content) {
  return std::string("<wst:RequestSecurityToken xmlns:wst=\"") + kTrust + "\" xmlns:wst14=\"" +
         kTrust14 + "\">" + content + "</wst:RequestSecurityToken>";
}

}  // namespace

std::string TimeFromNow(long seconds) {
  const std::time_t time = std::time(nullptr) + seconds;
  std::tm fields{};
  gmtime_r(&time, &fields);
  std::array<char, 40> text{};
  std::strftime(text.data(), text.size(), "%Y-%m-%dT%H:%M:%S.010Z", &fields);
  return text.data();
}

std::string IssueBody(const std::string& keyType, const std::string& more) {
  const std::string trust = kTrust;
  return Request(Leaf("TokenType", kSaml) + Leaf("RequestType", trust + "/Issue") +
                 Leaf("KeyType", trust + "/" + keyType) + Period("wst:Lifetime", 0, 3600) +
                 "<wst:Renewing Allow=\"true\" OK=\"false\"/>" + Leaf("Delegatable", "true") +
                 more);
}

std::string RenewBody(const std::string& assertion, long seconds) {
  return Request(Leaf("TokenType", kSaml) + Leaf("RequestType", std::string(kTrust) + "/Renew") +
                 Period("wst:Lifetime", 0, seconds) + Leaf("RenewTarget", assertion));
}

std::string ValidateBody(const std::string& assertion) {
  const std::string trust = kTrust;
  return Request(Leaf("TokenType", trust + "/RSTR/Status") +
                 Leaf("RequestType", trust + "/Validate") + Leaf("ValidateTarget", assertion));
}

std::string DelegateTo(const std::string& user) {
  return std::string("<wst:DelegateTo><wsse:UsernameToken xmlns:wsse=\"") + kWsse +
         "\"><wsse:Username>" + user + "</wsse:Username></wsse:UsernameToken></wst:DelegateTo>";
}

std::string ActAs(const std::string& assertion) {
  return "<wst14:ActAs>" + assertion + "</wst14:ActAs>";
}

std::string UsernameToken(const std::string& user, const std::string& password) {
  return std::string("<wsse:UsernameToken xmlns:wsse=\"") + kWsse + "\"><wsse:Username>" + user +
         "</wsse:Username><wsse:Password Type=\"" + kPasswordText + "\">" + password +
         "</wsse:Password></wsse:UsernameToken>";
}

std::string Timestamp(long created, long expires) {
  return Period("wsu:Timestamp", created, expires);
}

std::string Envelope(const std::string& tokens, const std::string& body) {
  return std::string("<soapenv:Envelope xmlns:soapenv=\"") + kSoap +
         "\"><soapenv:Header><wsse:Security xmlns:wsse=\"" + kWsse + "\">" + Timestamp() + tokens +
         "</wsse:Security></soapenv:Header><soapenv:Body xmlns:wst=\"" + kTrust + "\">" + body +
         "</soapenv:Body></soapenv:Envelope>";
}

std::string IssueEnvelope(const std::string& user, const std::string& password,
                          const std::string& more) {
  return Envelope(UsernameToken(user, password), IssueBody("Bearer", more));
}

std::string AliceEnvelope(const std::string& more) {
  return IssueEnvelope("alice@EXAMPLE.COM", "secret", more);
}

std::string Replaced(std::string text, const std::string& from, const std::string& to) {
  const std::size_t at = text.find(from);
  if (at == std::string::npos) {
    throw std::logic_error("not in the text: " + from);
  }
  return text.replace(at, from.size(), to);
}

std::string ElementText(const std::string& xml, const std::string& name) {
  std::size_t start = xml.find("<" + name);
  while (start != std::string::npos &&
         std::string(" />").find(xml[start + 1 + name.size()]) == std::string::npos) {
    start = xml.find("<" + name, start + 1);
  }
  const std::size_t from = xml.find('>', start);
  const std::size_t end = xml.find("</" + name + ">", from);
  if (start == std::string::npos || from == std::string::npos || end == std::string::npos) {
    return {};
  }
  return xml.substr(from + 1, end - from - 1);
}

std::string AssertionIn(const std::string& answer) {
  const std::string close = "</saml2:Assertion>";
  const std::size_t start = answer.find("<saml2:Assertion");
  const std::size_t end = answer.rfind(close);
  if (start == std::string::npos || end == std::string::npos) {
    return {};
  }
  return answer.substr(start, end + close.size() - start);
}

}  // namespace DevSts::Testing
