#include "attempts/deviations.h"

#include <algorithm>
#include <cstddef>
#include <set>

#include <tarnik/text/display_text.h>

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;
using std::chrono::seconds;

// The issued values are the service's own text.
constexpr std::size_t kMaxText = 500;

std::string TextOf(bool value) {
  return value ? "true" : "false";
}

std::string TextOf(const PrincipalId& principal) {
  return principal.name + "@" + principal.domain;
}

std::string TextOf(const std::set<std::string>& audiences) {
  std::string text;
  for (const std::string& audience : audiences) {
    text.append(text.empty() ? "" : ", ").append(audience);
  }
  return text.empty() ? "any" : text;
}

WallTime WallTimeOf(const Tarnik::System::DateTime& time) {
  return WallTime(
      std::chrono::duration_cast<milliseconds>(std::chrono::microseconds(time.GetUtcTime())));
}

class Comparison {
 public:
  template <class Value>
  void Compare(const char* field, const Value& requested, const Value& issued) {
    if (!(requested == issued)) {
      Add(field, TextOf(requested), TextOf(issued));
    }
  }

  void Add(const char* field, const std::string& requested, const std::string& issued) {
    DeviationRecord record;
    record.field = field;
    record.requested = Tarnik::ToDisplayText(requested, kMaxText);
    record.issued = Tarnik::ToDisplayText(issued, kMaxText);
    records_.push_back(std::move(record));
  }

  std::vector<DeviationRecord> Take() { return std::move(records_); }

 private:
  std::vector<DeviationRecord> records_;
};

void CompareLifetimes(Comparison& comparison, std::int64_t requestedSeconds, const SamlToken& token,
                      const Reception& reception) {
  constexpr std::int64_t kHundredth = 100;
  // No token is valid for longer than all years of four digits.
  constexpr std::int64_t kLongest = std::int64_t{10000} * 366 * 24 * 3600;
  const seconds requested(std::min(requestedSeconds, kLongest));
  // The start may be set back to allow for slow clocks.
  const WallTime start = std::max(WallTimeOf(token.StartTime()), reception.serviceNow);
  const milliseconds granted = WallTimeOf(token.ExpirationTime()) - start;
  const milliseconds tolerance = seconds(2) + requested / kHundredth + reception.duration;
  if (std::chrono::abs(granted - requested) > tolerance) {
    const auto rounded = std::chrono::round<seconds>(granted);
    comparison.Add("lifetime", std::to_string(requestedSeconds) + " s",
                   std::to_string(rounded.count()) + " s");
  }
}

bool IsBoundTo(const SamlToken& token, const Tarnik::Crypto::Certificate& key) {
  const auto bound = token.HolderOfKeyCertificate();
  return bound != nullptr && std::equal(bound->DerBytes(), bound->DerBytes() + bound->DerLength(),
                                        key.DerBytes(), key.DerBytes() + key.DerLength());
}

void CompareConfirmations(Comparison& comparison, const HolderOfKeyConfig* key,
                          const SamlToken& token) {
  const bool isBound = token.ConfirmationType() == TokenConfirmationType::HOLDER_OF_KEY;
  const auto name = [](bool bound) { return bound ? "holder-of-key" : "bearer"; };
  if (isBound != (key != nullptr)) {
    comparison.Add("confirmation", name(key != nullptr), name(isBound));
  } else if (isBound && !IsBoundTo(token, *key->certificate)) {
    comparison.Add("confirmation", "holder-of-key", "holder-of-key with another key");
  }
}

}  // namespace

boost::optional<PrincipalId> SubjectOf(const std::string& userName) {
  const std::size_t at = userName.rfind('@');
  if (at == std::string::npos || at == 0 || at + 1 == userName.size()) {
    return boost::none;
  }
  return PrincipalId{userName.substr(0, at), userName.substr(at + 1)};
}

std::vector<DeviationRecord> FindDeviations(const RequestedToken& requested, const SamlToken& token,
                                            const Reception& reception) {
  Comparison comparison;
  if (requested.subject) {
    comparison.Compare("subject", *requested.subject, token.Subject());
  }
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  comparison.Compare("audiences", requested.spec.audienceRestriction, audiences);
  CompareLifetimes(comparison, requested.spec.tokenLifetimeSec, token, reception);
  CompareConfirmations(comparison, requested.key, token);
  comparison.Compare("delegable", requested.spec.delegable, token.IsDelegable());
  comparison.Compare("renewable", requested.spec.renewable, token.IsRenewable());
  return comparison.Take();
}

}  // namespace SsoClient::Access
