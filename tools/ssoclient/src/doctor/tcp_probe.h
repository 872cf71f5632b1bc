#ifndef SSOCLIENT_TOOL_DOCTOR_TCP_PROBE_H
#define SSOCLIENT_TOOL_DOCTOR_TCP_PROBE_H

#include <chrono>
#include <string>
#include <utility>
#include <vector>

#include "doctor/address.h"
#include "doctor/time_limit.h"

namespace SsoClient::Tool::Doctor {

/// Owns a file descriptor.
class Descriptor {
 public:
  Descriptor() = default;
  explicit Descriptor(int number) noexcept : number_(number) {}
  Descriptor(Descriptor&& other) noexcept : number_(std::exchange(other.number_, -1)) {}
  Descriptor& operator=(Descriptor&& other) noexcept {
    std::swap(number_, other.number_);
    return *this;
  }
  ~Descriptor();

  int Number() const noexcept { return number_; }

 private:
  int number_ = -1;
};

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
/// Writes everything; false when that fails or takes longer than until `end`.
bool WriteAll(int socket, const std::string& octets, TimeLimit::Clock::time_point end);

}  // namespace SsoClient::Tool::Doctor

#endif
