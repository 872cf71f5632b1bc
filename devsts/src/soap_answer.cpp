#include "soap_answer.h"

#include "namespaces.h"

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

std::string WriteIssueEnvelope(const std::string& assertion, Time created, Time expires,
                               const XmlWriter::Attributes& declarations, bool indent) {
  XmlWriter xml(indent);
  XmlWriter::Attributes attributes{{"xmlns:soapenv", kSoapNamespace}};
  attributes.insert(attributes.end(), declarations.begin(), declarations.end());
  xml.Open("soapenv:Envelope", attributes);
  xml.Open("soapenv:Body");
  xml.Open("wst:RequestSecurityTokenResponseCollection", {{"xmlns:wst", kTrustNamespace}});
  xml.Open("wst:RequestSecurityTokenResponse");
  xml.Leaf("wst:TokenType", kSamlNamespace);
  xml.Open("wst:Lifetime", {{"xmlns:wsu", kWsuNamespace}});
  xml.Leaf("wsu:Created", TimeToText(created));
  xml.Leaf("wsu:Expires", TimeToText(expires));
  xml.Close();
  xml.Open("wst:RequestedSecurityToken");
  xml.Raw(assertion);
  xml.Close();
  xml.Close();
  xml.Close();
  xml.Close();
  xml.Close();
  return xml.Text();
}

}  // namespace DevSts
