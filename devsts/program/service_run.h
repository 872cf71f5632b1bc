#ifndef DEVSTS_PROGRAM_SERVICE_RUN_H
#define DEVSTS_PROGRAM_SERVICE_RUN_H

#include <functional>

#include "options.h"

namespace DevSts::Program {

// Runs the service until it is asked to end. Calls `ready` when it accepts connections and has
// printed so. There must be only one thread. Throws ProgramError or std::exception.
void RunService(Options options, const std::function<void()>& ready);

}  // namespace DevSts::Program

#endif
