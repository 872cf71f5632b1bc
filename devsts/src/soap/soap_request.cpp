#include "soap/soap_request.h"

#include <regex>

#include "devsts/xml_security.h"
#include "soap/element_reader.h"
#include "soap/fault.h"
#include "xml/namespaces.h"

namespace DevSts {
namespace {

void RequireOneField(const ReceivedRequest& request, const char* name) {
  if (request.HeaderCount(name) != 1) {
    ThrowInvalidRequest(std::string(name) + " is not given exactly once");
  }
}

// The only parameter that text/xml has is the encoding, which takes precedence over that of the XML
// declaration (RFC 7303, sections 3.2 and 9.2).
void RequireTextXml(const ReceivedRequest& request) {
  static const std::regex& kForm =
      *new std::regex(R"(text/xml([ \t]*;[ \t]*charset=("utf-8"|utf-8))?)", std::regex::icase);
  RequireOneField(request, "Content-Type");
  const std::string type = request.Header("Content-Type");
  if (!std::regex_match(type, kForm)) {
    ThrowInvalidRequest("Content-Type is not text/xml but " + type);
  }
  if (request.HeaderCount("Content-Encoding") != 0) {
    ThrowInvalidRequest("Content-Encoding is not expected");
  }
}

DocumentHandle ParseEnvelope(const std::string& body) {
  try {
    return ParseXml(body);
  } catch (const XmlError& error) {
    ThrowInvalidRequest(std::string("The request is not well-formed: ") + error.what());
  }
}

// WS-Security 1.1, section 4.2: ids must be unique in the document.
void RegisterUniqueIds(xmlDoc* document) {
  try {
    RegisterIds(document);
  } catch (const XmlError& error) {
    ThrowInvalidSecurity(std::string("The request is ambiguous: ") + error.what());
  }
}

}  // namespace

std::string ReadSoapAction(const ReceivedRequest& request) {
  if (request.method != "POST") {
    ThrowInvalidRequest("The method is not POST but " + request.method);
  }
  RequireOneField(request, "Host");  // RFC 9112, section 3.2
  RequireTextXml(request);
  RequireOneField(request, "SOAPAction");
  const std::string action = request.Header("SOAPAction");
  if (action.size() < 2 || action.front() != '"' || action.back() != '"') {
    ThrowInvalidRequest("SOAPAction is not in quotes: " + action);
  }
  return action.substr(1, action.size() - 2);
}

SoapRequest ReadEnvelope(const std::string& body, const char* entryName) {
  SoapRequest request{ParseEnvelope(body)};
  xmlNode* envelope = xmlDocGetRootElement(request.document.get());
  if (!IsElement(envelope, kSoapNamespace, "Envelope")) {
    ThrowInvalidRequest("The request is not a SOAP 1.1 envelope");
  }
  // SOAP 1.1, section 3
  if (HasProcessingInstruction(request.document.get())) {
    ThrowInvalidRequest("The request contains a processing instruction");
  }
  RequireAttributes(envelope, {});
  ElementReader reader(envelope);
  request.header = reader.Expect(kSoapNamespace, "Header");
  request.body = reader.Expect(kSoapNamespace, "Body");
  reader.End();
  RegisterUniqueIds(request.document.get());
  ElementReader bodyReader(request.body);
  if (bodyReader.AtEnd()) {
    ThrowInvalidRequest("The Body is empty");
  }
  request.bodyEntry = bodyReader.Expect(kTrustNamespace, entryName);
  bodyReader.End();
  return request;
}

}  // namespace DevSts
