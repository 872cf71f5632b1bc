#ifndef DEVSTS_SOAP_BINARY_EXCHANGE_H
#define DEVSTS_SOAP_BINARY_EXCHANGE_H

#include <libxml/tree.h>

#include <string>

#include "xml/schema_values.h"

namespace DevSts {

inline constexpr char kSpnegoValueType[] = "http://schemas.xmlsoap.org/ws/2005/02/trust/spnego";

// What a client says in a negotiation (WS-Trust 1.3, section 8).
struct NegotiationLeg {
  std::string context;
  Octets octets;
};

// Reads wst:BinaryExchange and the Context, which is the only attribute that the element around it
// may have. Throws Fault.
NegotiationLeg ReadLeg(xmlNode* message, xmlNode* binaryExchange);

// wst:RequestSecurityTokenResponse with which a client goes on. Throws Fault.
NegotiationLeg ReadContinuedLeg(xmlNode* requestSecurityTokenResponse);

}  // namespace DevSts

#endif
