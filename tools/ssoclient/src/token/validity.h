#ifndef SSOCLIENT_TOOL_TOKEN_VALIDITY_H
#define SSOCLIENT_TOOL_TOKEN_VALIDITY_H

#include <string>

#include <tarnik/system/date_time.h>

namespace SsoClient::Tool {

/// A period of validity, and a moment that is before, in or after it. The end itself is after it
/// (SAML 2.0 core, section 2.5.1.2).
struct Validity {
  Tarnik::System::DateTime start{};
  Tarnik::System::DateTime end{};
  Tarnik::System::DateTime now{};

  enum class State { kNotYetValid, kValid, kExpired };
  State GetState() const;
  /// "not-yet-valid", "valid" or "expired".
  const char* StateName() const;
  /// The part of the period that has passed: 0 at its start, 1 at its end.
  double Position() const;
  /// In whole percent, from 0 to 100.
  int Percent() const;
  /// For people: "valid for 2 h 5 min", "expired 3 min ago" or "not valid yet: valid in 10 min".
  std::string ToString() const;
};

}  // namespace SsoClient::Tool

#endif
