#ifndef DEVSTS_PROGRAM_FAULT_NAMES_H
#define DEVSTS_PROGRAM_FAULT_NAMES_H

#include <string>

#include "devsts/misbehavior.h"

namespace DevSts::Program {

// The values that describe a fault. Each function throws std::invalid_argument for a wrong one.

// PREFIX:NAME with the prefix soap, wst, wsse or wsu, {NAMESPACE}NAME or NAME.
void SetFaultCode(const std::string& text, FaultAnswer& fault);
// A status of HTTP.
int HttpStatusFrom(const std::string& value);

}  // namespace DevSts::Program

#endif
