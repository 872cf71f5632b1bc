#include "soap/binary_exchange.h"

#include <memory>

#include <libxml/uri.h>

#include "devsts/xml_security.h"
#include "soap/element_reader.h"
#include "soap/fault.h"
#include "xml/document.h"
#include "xml/namespaces.h"
#include "xml/schema_values.h"

namespace DevSts {
namespace {

struct FreeUri {
  void operator()(xmlURI* uri) const { xmlFreeURI(uri); }
};

void RequireAbsoluteUri(const std::string& context) {
  const std::unique_ptr<xmlURI, FreeUri> uri(xmlParseURI(context.c_str()));
  if (uri == nullptr || uri->scheme == nullptr) {
    ThrowInvalidRequest("The Context is not an absolute URI: " + context);
  }
}

}  // namespace

NegotiationLeg ReadLeg(xmlNode* message, xmlNode* binaryExchange) {
  RequireAttributes(message, {{"Context"}});
  NegotiationLeg leg{AttributeOf(message, "Context"), {}};
  RequireAbsoluteUri(leg.context);
  RequireAttributes(binaryExchange, {{"EncodingType"}, {"ValueType"}});
  if (AttributeOf(binaryExchange, "EncodingType") != kBase64Binary) {
    ThrowInvalidRequest("BinaryExchange/@EncodingType is not Base64Binary");
  }
  if (AttributeOf(binaryExchange, "ValueType") != kSpnegoValueType) {
    ThrowInvalidRequest("BinaryExchange/@ValueType is not SPNEGO's");
  }
  try {
    leg.octets = FromBase64(TextOf(binaryExchange));
  } catch (const XmlError&) {
    ThrowInvalidRequest("The BinaryExchange is not Base64");
  }
  return leg;
}

NegotiationLeg ReadContinuedLeg(xmlNode* requestSecurityTokenResponse) {
  ElementReader reader(requestSecurityTokenResponse);
  xmlNode* exchange = reader.Expect(kTrustNamespace, "BinaryExchange");
  reader.End();
  return ReadLeg(requestSecurityTokenResponse, exchange);
}

}  // namespace DevSts
