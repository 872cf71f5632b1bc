#ifndef SSOCLIENT_TOOL_DOCTOR_DNS_PROBE_H
#define SSOCLIENT_TOOL_DOCTOR_DNS_PROBE_H

#include <functional>
#include <string>
#include <vector>

#include "doctor/address.h"
#include "doctor/report.h"
#include "doctor/time_limit.h"

namespace SsoClient::Tool::Doctor {

/// What the resolver has answered.
struct Resolution {
  std::vector<Address> addresses{};  ///< each once, in the resolver's order
  std::string errorText{};
  int error = 0;  ///< of `getaddrinfo` (RFC 3493, section 6.1)
  bool isTimedOut = false;
};

using Resolver = std::function<Resolution(const std::string& host, int port)>;

/// Asks the resolver of this system.
Resolution ResolveBySystem(const std::string& host, int port);
/// The answer of `resolver`, which runs on a thread of its own and is left to itself at `end`.
Resolution ResolveUntil(const Resolver& resolver, const std::string& host, int port,
                        TimeLimit::Clock::time_point end);

/// What the answer means.
Finding FindingOfResolution(const std::string& host, const Resolution& resolution);

}  // namespace SsoClient::Tool::Doctor

#endif
