#ifndef SSOCLIENT_TESTS_STS_ANSWERS_H
#define SSOCLIENT_TESTS_STS_ANSWERS_H

#include <string>

namespace SsoClient::Testing {

inline constexpr char kAssertionXml[] =
    R"(<saml2:Assertion xmlns:saml2="urn:oasis:names:tc:SAML:2.0:assertion" ID="_1">)"
    R"(<saml2:Issuer>sts</saml2:Issuer></saml2:Assertion>)";

/// A SOAP 1.1 envelope around `body`, with the prefixes wst and wsse bound.
inline std::string Envelope(const std::string& body) {
  return R"(<S:Envelope xmlns:S="http://schemas.xmlsoap.org/soap/envelope/">)"
         R"(<S:Header/><S:Body xmlns:wst="http://docs.oasis-open.org/ws-sx/ws-trust/200512")"
         R"( xmlns:wsse="http://docs.oasis-open.org/wss/2004/01/)"
         R"(oasis-200401-wss-wssecurity-secext-1.0.xsd">)" +
         body + "</S:Body></S:Envelope>";
}

inline std::string Rstr(const std::string& content, const std::string& attributes = {}) {
  return "<wst:RequestSecurityTokenResponse" + attributes + ">" + content +
         "</wst:RequestSecurityTokenResponse>";
}

inline std::string Collection(const std::string& content) {
  return "<wst:RequestSecurityTokenResponseCollection>" + content +
         "</wst:RequestSecurityTokenResponseCollection>";
}

inline std::string Requested(const std::string& content) {
  return "<wst:RequestedSecurityToken>" + content + "</wst:RequestedSecurityToken>";
}

inline std::string Fault(const std::string& content) {
  return "<S:Fault>" + content + "</S:Fault>";
}

inline std::string Fault(const std::string& code, const std::string& text) {
  return Fault("<faultcode>" + code + "</faultcode><faultstring>" + text + "</faultstring>");
}

inline std::string IssueAnswer() {
  return Envelope(Collection(Rstr(Requested(kAssertionXml))));
}

inline std::string RenewAnswer() {
  return Envelope(Rstr(Requested(kAssertionXml)));
}

/// A leg of the bytes 1, 2 and 3.
inline constexpr char kLeg[] = "<wst:BinaryExchange>AQID</wst:BinaryExchange>";

/// The answer to a leg that is not the last.
inline std::string LegAnswer(const std::string& context, const std::string& leg = kLeg) {
  return Envelope(Rstr(leg, " Context=\"" + context + "\""));
}

/// The answer that ends a negotiation with a token.
inline std::string LastLegAnswer(const std::string& assertion = kAssertionXml,
                                 const std::string& leg = {}, const std::string& context = "c") {
  return Envelope(
      Collection(Rstr(leg + "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>" +
                          Requested(assertion),
                      " Context=\"" + context + "\"")));
}

/// The canonical text of `kAssertionXml` inside `Envelope`, with the declarations that it inherits.
inline constexpr char kCanonicalAssertion[] =
    R"(<saml2:Assertion xmlns:S="http://schemas.xmlsoap.org/soap/envelope/")"
    R"( xmlns:saml2="urn:oasis:names:tc:SAML:2.0:assertion")"
    R"( xmlns:wsse="http://docs.oasis-open.org/wss/2004/01/)"
    R"(oasis-200401-wss-wssecurity-secext-1.0.xsd")"
    R"( xmlns:wst="http://docs.oasis-open.org/ws-sx/ws-trust/200512" ID="_1">)"
    R"(<saml2:Issuer>sts</saml2:Issuer></saml2:Assertion>)";

}  // namespace SsoClient::Testing

#endif
