#ifndef DEVSTS_SOAP_BINARY_EXCHANGE_H
#define DEVSTS_SOAP_BINARY_EXCHANGE_H

#include <string>

#include <libxml/tree.h>

#include "xml/schema_values.h"

namespace DevSts {

inline constexpr char kSpnegoValueType[] = "http://schemas.xmlsoap.org/ws/2005/02/trust/spnego";

// A client's leg of a negotiation (WS-Trust 1.3, section 8).
struct NegotiationLeg {
  std::string context;
  Octets octets;
};

// Reads wst:BinaryExchange and the Context of `message`, which must not have other attributes.
// Throws Fault.
NegotiationLeg ReadLeg(xmlNode* message, xmlNode* binaryExchange);

// Reads the wst:RequestSecurityTokenResponse that continues a negotiation. Throws Fault.
NegotiationLeg ReadContinuedLeg(xmlNode* requestSecurityTokenResponse);

}  // namespace DevSts

#endif
