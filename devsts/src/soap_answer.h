#ifndef DEVSTS_SOAP_ANSWER_H
#define DEVSTS_SOAP_ANSWER_H

#include <string>

#include "assertion_writer.h"
#include "devsts/misbehavior.h"

namespace DevSts {

// A SOAP 1.1 envelope that carries a fault (section 4.4).
std::string WriteFaultEnvelope(const FaultAnswer& fault);

// How an answer wraps its RequestSecurityTokenResponse (WS-Trust 1.3, sections 4.3 and 5).
enum class TokenAnswer {
  Issued,   // in a RequestSecurityTokenResponseCollection
  Renewed,  // alone
};

// The envelope of an answer around the assertion's markup, which is put in as it stands.
// `declarations` go onto the envelope.
std::string WriteTokenEnvelope(TokenAnswer kind, const std::string& assertion, Time created,
                               Time expires, const XmlWriter::Attributes& declarations,
                               bool indent);

// The envelope of a Validate answer (WS-Trust 1.3, section 7).
std::string WriteStatusEnvelope(bool valid, const std::string& reason);

}  // namespace DevSts

#endif
