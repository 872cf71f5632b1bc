#ifndef SSOCLIENT_TOOL_DOCTOR_TCP_PROBE_H
#define SSOCLIENT_TOOL_DOCTOR_TCP_PROBE_H

#include <chrono>
#include <string>
#include <vector>

#include "doctor/address.h"
#include "doctor/time_limit.h"
#include "input/descriptor.h"

namespace SsoClient::Tool::Doctor {

/// A connection that was tried.
struct TcpAttempt {
  Address address{};
  std::chrono::microseconds duration{0};
  /// The non-blocking socket.
  Descriptor socket{};
  /// The error of `connect`; ETIMEDOUT when the time is over, 0 when it is connected.
  int error = 0;
};

/// Connects to all addresses at once; each attempt ends at `end` at the latest.
std::vector<TcpAttempt> ConnectToAll(const std::vector<Address>& addresses,
                                     TimeLimit::Clock::time_point end);

/// What a read from a socket has given.
enum class Reading { kOctets, kEnd, kTimedOut, kFailed };

/// Waits for octets until `end` and appends them to `octets`.
Reading ReadSome(int socket, TimeLimit::Clock::time_point end, std::string& octets);
/// Sends everything; false when that fails or takes longer than until `end`.
bool SendAll(int socket, const std::string& octets, TimeLimit::Clock::time_point end);

}  // namespace SsoClient::Tool::Doctor

#endif
