#include "token/validity.h"

#include <algorithm>

#include "output/duration_text.h"

namespace SsoClient::Tool {

Validity::State Validity::GetState() const {
  if (now < start) {
    return State::kNotYetValid;
  }
  return now < end ? State::kValid : State::kExpired;
}

const char* Validity::StateName() const {
  switch (GetState()) {
    case State::kNotYetValid:
      return "not-yet-valid";
    case State::kValid:
      return "valid";
    case State::kExpired:
      return "expired";
  }
  return "";
}

double Validity::Position() const {
  const double length =
      static_cast<double>(end.GetUtcTime()) - static_cast<double>(start.GetUtcTime());
  const double passed =
      static_cast<double>(now.GetUtcTime()) - static_cast<double>(start.GetUtcTime());
  if (GetState() == State::kExpired) {
    return std::max(1.0, length > 0 ? passed / length : 1.0);
  }
  // A period whose end is at its start has no inside.
  return length > 0 ? std::min(passed / length, 1.0) : -1.0;
}

int Validity::Percent() const {
  return static_cast<int>(std::clamp(Position(), 0.0, 1.0) * 100);
}

std::string Validity::ToString() const {
  switch (GetState()) {
    case State::kNotYetValid:
      return "not valid yet: valid in " + DurationText(SecondsBetween(now, start));
    case State::kValid:
      return "valid for " + DurationText(SecondsBetween(now, end));
    case State::kExpired:
      return "expired " + DurationText(SecondsBetween(end, now)) + " ago";
  }
  return {};
}

}  // namespace SsoClient::Tool
