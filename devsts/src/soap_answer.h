#ifndef DEVSTS_SOAP_ANSWER_H
#define DEVSTS_SOAP_ANSWER_H

#include <string>

#include "assertion_writer.h"
#include "devsts/misbehavior.h"

namespace DevSts {

// A SOAP 1.1 envelope that carries a fault (section 4.4).
std::string WriteFaultEnvelope(const FaultAnswer& fault);

// The envelope of an Issue answer (WS-Trust 1.3, section 4.3) around the assertion's markup, which
// is put in as it stands. `declarations` go onto the envelope.
std::string WriteIssueEnvelope(const std::string& assertion, Time created, Time expires,
                               const XmlWriter::Attributes& declarations, bool indent);

}  // namespace DevSts

#endif
