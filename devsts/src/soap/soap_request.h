#ifndef DEVSTS_SOAP_SOAP_REQUEST_H
#define DEVSTS_SOAP_SOAP_REQUEST_H

#include <string>

#include "devsts/server.h"
#include "xml/document.h"

namespace DevSts {

// The parts of a SOAP 1.1 request (sections 4 and 6).
struct SoapRequest {
  DocumentHandle document;
  xmlNode* header = nullptr;
  xmlNode* body = nullptr;
  xmlNode* bodyEntry = nullptr;
};

// Checks the HTTP part of the request and returns the action without the quotes of the SOAPAction
// field. Throws Fault.
std::string ReadSoapAction(const ReceivedRequest& request);

// Parses the envelope, whose Body must contain only a WS-Trust element of this name, and registers
// the ids of the document. Throws Fault.
SoapRequest ReadEnvelope(const std::string& body, const char* entryName);

}  // namespace DevSts

#endif
