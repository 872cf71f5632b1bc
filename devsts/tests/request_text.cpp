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

std::string Period(const std::string& element, long seconds) {
  return "<" + element + " xmlns:wsu=\"" + kWsu + "\"><wsu:Created>" + TimeFromNow(0) +
         "</wsu:Created><wsu:Expires>" + TimeFromNow(seconds) + "</wsu:Expires></" + element + ">";
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

std::string IssueEnvelope(const std::string& user, const std::string& password,
                          const std::string& more) {
  const std::string trust = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
  return "<soapenv:Envelope xmlns:soapenv=\"http://schemas.xmlsoap.org/soap/envelope/\">"
         "<soapenv:Header><wsse:Security xmlns:wsse=\"" +
         std::string(kWsse) + "\">" + Period("wsu:Timestamp", 600) +
         "<wsse:UsernameToken xmlns:wsse=\"" + kWsse + "\"><wsse:Username>" + user +
         "</wsse:Username><wsse:Password Type=\"" + kPasswordText + "\">" + password +
         "</wsse:Password></wsse:UsernameToken></wsse:Security></soapenv:Header>"
         "<soapenv:Body xmlns:wst=\"" +
         trust + "\"><wst:RequestSecurityToken xmlns:wst=\"" + trust +
         "\" xmlns:wst14=\"http://docs.oasis-open.org/ws-sx/ws-trust/200802\">"
         "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>"
         "<wst:RequestType>" +
         trust + "/Issue</wst:RequestType><wst:KeyType>" + trust + "/Bearer</wst:KeyType>" +
         Period("wst:Lifetime", 3600) +
         "<wst:Renewing Allow=\"true\" OK=\"false\"/><wst:Delegatable>true</wst:Delegatable>" +
         more + "</wst:RequestSecurityToken></soapenv:Body></soapenv:Envelope>";
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
