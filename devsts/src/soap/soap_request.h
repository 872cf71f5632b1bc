#ifndef DEVSTS_SOAP_SOAP_REQUEST_H
#define DEVSTS_SOAP_SOAP_REQUEST_H

#include <string>

#include "devsts/server.h"
#include "xml/document.h"

namespace DevSts {

// A SOAP 1.1 request (sections 4 and 6): its envelope taken apart.
struct SoapRequest {
  DocumentHandle document;
  xmlNode* header = nullptr;
  xmlNode* body = nullptr;
  xmlNode* bodyEntry = nullptr;
};

// The action in the SOAPAction field's quotes, after the HTTP part of the request was looked at.
// Throws Fault.
std::string ReadSoapAction(const ReceivedRequest& request);

// The Body must hold a WS-Trust element of this name alone. The ids of the document are registered
// with it afterwards. Throws Fault.
SoapRequest ReadEnvelope(const std::string& body, const char* entryName);

}  // namespace DevSts

#endif
