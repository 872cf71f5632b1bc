#ifndef DEVSTS_PROGRAM_MISBEHAVIOR_NAMES_H
#define DEVSTS_PROGRAM_MISBEHAVIOR_NAMES_H

#include "devsts/misbehavior.h"
#include "vocabulary.h"

namespace DevSts::Program {

// The names of --misbehave and of the command misbehave.
const Vocabulary<Misbehavior>& MisbehaviorNames();

// The misbehaviour of all texts together. Throws std::invalid_argument.
Misbehavior MisbehaviorFrom(const std::vector<std::string>& texts);

}  // namespace DevSts::Program

#endif
