#ifndef DEVSTS_PROGRAM_CONTROL_CLIENT_H
#define DEVSTS_PROGRAM_CONTROL_CLIENT_H

#include <string>
#include <vector>

namespace DevSts::Program {

// Sends the command to the service with this control socket. Prints the answer to standard output
// and returns 0, or prints the error to the standard error output and returns 1.
int RunControlClient(const std::string& path, const std::vector<std::string>& command);

}  // namespace DevSts::Program

#endif
