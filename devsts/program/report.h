#ifndef DEVSTS_PROGRAM_REPORT_H
#define DEVSTS_PROGRAM_REPORT_H

#include <cstdint>
#include <string>

#include "devsts/server.h"

namespace DevSts::Program {

// The properties of a request as NAME=VALUE, without its body, which contains passwords.
std::string DescribeRequest(const ReceivedRequest& request);
// The counters as NAME=VALUE.
std::string DescribeCounters(const Counters& counters);
// The counter with this name. Throws std::invalid_argument for an unknown name.
std::uint64_t CounterNamed(const std::string& name, const Counters& counters);

}  // namespace DevSts::Program

#endif
