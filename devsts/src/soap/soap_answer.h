#ifndef DEVSTS_SOAP_SOAP_ANSWER_H
#define DEVSTS_SOAP_SOAP_ANSWER_H

#include <optional>
#include <string>

#include "devsts/misbehavior.h"
#include "xml/schema_values.h"
#include "xml/writer.h"

namespace DevSts {

// A SOAP 1.1 envelope that contains a fault (section 4.4).
std::string WriteFaultEnvelope(const FaultAnswer& fault);

// How an answer wraps its RequestSecurityTokenResponse (WS-Trust 1.3, sections 4.3 and 5).
enum class TokenAnswer {
  Issued,   // in a RequestSecurityTokenResponseCollection
  Renewed,  // without a collection
};

// A service's leg of a negotiation (WS-Trust 1.3, section 8).
struct ServerLeg {
  std::optional<std::string> context;
  std::optional<Octets> octets;
};

// The envelope of an answer that asks for the next leg.
std::string WriteLegEnvelope(const ServerLeg& leg);

// The envelope of an answer that contains the assertion's markup unchanged. `declarations` are
// added to the envelope element. `leg` is the last leg of a negotiation, if there was one.
std::string WriteTokenEnvelope(TokenAnswer kind, const std::string& assertion, Time created,
                               Time expires, const XmlWriter::Attributes& declarations, bool indent,
                               const ServerLeg& leg = {});

// The envelope of a Validate answer (WS-Trust 1.3, section 7).
std::string WriteStatusEnvelope(bool valid, const std::string& reason);

}  // namespace DevSts

#endif
