#include "soap/soap_answer.h"

#include "soap/binary_exchange.h"
#include "xml/namespaces.h"
#include "xml/schema_values.h"

namespace DevSts {
namespace {

std::string PrefixFor(const std::string& namespaceUri) {
  if (namespaceUri == kTrustNamespace) {
    return "wst";
  }
  if (namespaceUri == kWsseNamespace) {
    return "wsse";
  }
  return namespaceUri == kWsuNamespace ? "wsu" : "code";
}

XmlWriter::Attributes ContextOf(const ServerLeg& leg) {
  return leg.context ? XmlWriter::Attributes{{"Context", *leg.context}} : XmlWriter::Attributes();
}

void WriteExchange(const ServerLeg& leg, XmlWriter& xml) {
  if (leg.octets) {
    xml.Leaf("wst:BinaryExchange",
             {{"EncodingType", kBase64Binary}, {"ValueType", kSpnegoValueType}},
             leg.octets->empty() ? std::string() : ToBase64(*leg.octets));
  }
}

}  // namespace

std::string WriteFaultEnvelope(const FaultAnswer& fault) {
  XmlWriter xml;
  xml.Open("soapenv:Envelope", {{"xmlns:soapenv", kSoapNamespace}});
  xml.Open("soapenv:Body");
  xml.Open("soapenv:Fault");
  if (fault.codeNamespace.empty()) {
    xml.Leaf("faultcode", fault.codeName);
  } else {
    const std::string prefix = PrefixFor(fault.codeNamespace);
    xml.Leaf("faultcode", {{"xmlns:" + prefix, fault.codeNamespace}},
             prefix + ":" + fault.codeName);
  }
  if (!fault.omitFaultString) {
    xml.Leaf("faultstring", fault.faultString);
  }
  xml.Close();
  xml.Close();
  xml.Close();
  return xml.Text();
}

std::string WriteTokenEnvelope(TokenAnswer kind, const std::string& assertion, Time created,
                               Time expires, const XmlWriter::Attributes& declarations, bool indent,
                               const ServerLeg& leg) {
  XmlWriter xml(indent);
  XmlWriter::Attributes attributes{{"xmlns:soapenv", kSoapNamespace}};
  attributes.insert(attributes.end(), declarations.begin(), declarations.end());
  xml.Open("soapenv:Envelope", attributes);
  xml.Open("soapenv:Body", {{"xmlns:wst", kTrustNamespace}});
  if (kind == TokenAnswer::Issued) {
    xml.Open("wst:RequestSecurityTokenResponseCollection");
  }
  xml.Open("wst:RequestSecurityTokenResponse", ContextOf(leg));
  xml.Leaf("wst:TokenType", kSamlNamespace);
  xml.Open("wst:Lifetime", {{"xmlns:wsu", kWsuNamespace}});
  xml.Leaf("wsu:Created", TimeToText(created));
  xml.Leaf("wsu:Expires", TimeToText(expires));
  xml.Close();
  xml.Open("wst:RequestedSecurityToken");
  xml.Raw(assertion);
  xml.Close();
  WriteExchange(leg, xml);
  xml.Close();
  if (kind == TokenAnswer::Issued) {
    xml.Close();
  }
  xml.Close();
  xml.Close();
  return xml.Text();
}

std::string WriteLegEnvelope(const ServerLeg& leg) {
  XmlWriter xml;
  xml.Open("soapenv:Envelope", {{"xmlns:soapenv", kSoapNamespace}});
  xml.Open("soapenv:Body", {{"xmlns:wst", kTrustNamespace}});
  xml.Open("wst:RequestSecurityTokenResponse", ContextOf(leg));
  WriteExchange(leg, xml);
  xml.Close();
  xml.Close();
  xml.Close();
  return xml.Text();
}

std::string WriteStatusEnvelope(bool valid, const std::string& reason) {
  const std::string trust = kTrustNamespace;
  XmlWriter xml;
  xml.Open("soapenv:Envelope", {{"xmlns:soapenv", kSoapNamespace}});
  xml.Open("soapenv:Body");
  xml.Open("wst:RequestSecurityTokenResponse", {{"xmlns:wst", trust}});
  xml.Leaf("wst:TokenType", trust + "/RSTR/Status");
  xml.Open("wst:Status");
  xml.Leaf("wst:Code", trust + (valid ? "/status/valid" : "/status/invalid"));
  if (!reason.empty()) {
    xml.Leaf("wst:Reason", reason);
  }
  xml.Close();
  xml.Close();
  xml.Close();
  xml.Close();
  return xml.Text();
}

}  // namespace DevSts
