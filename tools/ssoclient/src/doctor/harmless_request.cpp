#include "doctor/harmless_request.h"

#include <string_view>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>
#include <tarnik/text/display_text.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/xml_parser.h>

namespace SsoClient::Tool::Doctor {
namespace {

using Tarnik::Xml::ElementNode;

constexpr const char* kSoap = "http://schemas.xmlsoap.org/soap/envelope/";
constexpr const char* kSoap12 = "http://www.w3.org/2003/05/soap-envelope";
constexpr const char* kTrust = "http://docs.oasis-open.org/ws-sx/ws-trust/200512";
constexpr const char* kSecurity =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd";
constexpr const char* kUtility =
    "http://docs.oasis-open.org/wss/2004/01/oasis-200401-wss-wssecurity-utility-1.0.xsd";
constexpr std::size_t kShownText = 200;

std::string TextOf(const ElementNode* element) {
  std::string text;
  for (const Tarnik::Xml::Node* child = element != nullptr ? element->FirstChild() : nullptr;
       child != nullptr; child = child->NextSibling()) {
    if (const auto* part = dynamic_cast<const Tarnik::Xml::TextNode*>(child)) {
      text += part->Text();
    }
  }
  return text;
}

Finding NotSts(const std::string& why) {
  return Failure(ExitStatus::kUnreachable, "not-an-sts", "the answer is not of an STS: " + why,
                 "check the host, the port and the path of the URL");
}

// The namespace of a fault's code, which is a qualified name (SOAP 1.1, section 4.4).
std::string_view NamespaceOf(const ElementNode& element, std::string_view code) {
  const std::size_t colon = code.find(':');
  const std::string_view prefix = colon == std::string_view::npos ? "" : code.substr(0, colon);
  return element.LookupNamespace(prefix).value_or("");
}

Finding FindingOfFault(const ElementNode& fault) {
  const ElementNode* codeElement = fault.FirstChildElement("faultcode");
  const ElementNode* textElement = fault.FirstChildElement("faultstring");
  const std::string code = TextOf(codeElement);
  const std::string text = TextOf(textElement);
  const std::string shown =
      Tarnik::ToDisplayText(code + (text.empty() ? "" : ": " + text), kShownText);
  const std::string_view space = codeElement != nullptr ? NamespaceOf(*codeElement, code) : "";
  if (space == kTrust || space == kSecurity) {
    return Fine("an STS, which answers a request without a token with the fault " + shown);
  }
  return Warning(ExitStatus::kUnreachable, "sts-uncertain",
                 "a SOAP service, but its fault does not show that it is an STS: " + shown,
                 "check the path of the URL if logins fail");
}

Finding FindingOfEnvelope(const ElementNode& root) {
  if (root.LocalName() != "Envelope") {
    return NotSts("the document is '" + Tarnik::ToDisplayText(root.LocalName(), kShownText) + "'");
  }
  if (root.NamespaceUri() == kSoap12) {
    return NotSts("it is SOAP 1.2, and only SOAP 1.1 is supported");
  }
  const ElementNode* body = root.FirstChildElement("Body");
  if (root.NamespaceUri() != kSoap || body == nullptr) {
    return NotSts("the Envelope is not of SOAP 1.1");
  }
  if (const ElementNode* fault = body->FirstChildElement(kSoap, "Fault")) {
    return FindingOfFault(*fault);
  }
  const ElementNode* content = body->NextElement(body);
  if (content != nullptr && content->NamespaceUri() == kTrust) {
    return Fine("an STS, which answers with " + std::string(content->LocalName()));
  }
  return NotSts("the Body contains neither a fault nor an answer of WS-Trust 1.3");
}

}  // namespace

std::string HarmlessRequest(const Tarnik::System::DateTime& now) {
  constexpr long kLifetime = 5L * 60 * 1000000;
  const auto expires = Tarnik::System::DateTimeFromUtc(now.GetUtcTime() + kLifetime, false);
  const std::string trust = kTrust;
  return std::string("<S:Envelope xmlns:S=\"") + kSoap + "\"><S:Header><o:Security xmlns:o=\"" +
         kSecurity + "\" xmlns:u=\"" + kUtility + "\"><u:Timestamp>" + "<u:Created>" +
         now.ToString() + "</u:Created><u:Expires>" + expires.ToString() +
         "</u:Expires></u:Timestamp></o:Security></S:Header><S:Body>" +
         "<t:RequestSecurityToken xmlns:t=\"" + trust + "\"><t:TokenType>" + trust +
         "/RSTR/Status</t:TokenType><t:RequestType>" + trust +
         "/Validate</t:RequestType></t:RequestSecurityToken></S:Body></S:Envelope>";
}

Finding FindingOfSoapAnswer(const std::string& body) {
  try {
    const auto reader = Tarnik::CreateStringReader(body);
    const auto handler = Tarnik::Xml::CreateXMLDocumentHandler();
    const auto parsed = Tarnik::Xml::CreateXMLParser(reader.get(), handler.get())->Parse();
    return FindingOfEnvelope(
        *Tarnik::CheckedCast<Tarnik::Xml::Document>(parsed.get())->RootElement());
  } catch (const Tarnik::Exception& malformed) {
    return NotSts(std::string("it is not XML (") + malformed.what() + ")");
  }
}

}  // namespace SsoClient::Tool::Doctor
