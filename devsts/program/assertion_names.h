#ifndef DEVSTS_PROGRAM_ASSERTION_NAMES_H
#define DEVSTS_PROGRAM_ASSERTION_NAMES_H

#include "devsts/negotiation.h"
#include "devsts/server.h"
#include "vocabulary.h"

namespace DevSts::Program {

// The names of --assertion and of the command assertion.
const Vocabulary<AssertionOptions>& AssertionNames();

// Throws std::invalid_argument if the key cannot make signatures of the algorithm.
void RequireMatchingKey(const AssertionOptions& options);

// The names of --negotiation and of the command negotiation.
const Vocabulary<NegotiationScript>& NegotiationNames();

}  // namespace DevSts::Program

#endif
