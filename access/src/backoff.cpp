#include "backoff.h"

#include <algorithm>

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;

milliseconds Ceiling(const RetryConfig& config, int failures) {
  milliseconds ceiling = std::min(config.firstDelay, config.longestDelay);
  for (int doubled = 1; doubled < failures && ceiling < config.longestDelay; ++doubled) {
    ceiling = std::min(ceiling * 2, config.longestDelay);
  }
  return ceiling;
}

}  // namespace

milliseconds Backoff(const RetryConfig& config, int failures, milliseconds retryAfter,
                     double draw) {
  // The lower half is not random, since random pauses from zero on have no bound of their number.
  const milliseconds ceiling = Ceiling(config, failures);
  const auto spread = static_cast<double>((ceiling / 2).count());
  const milliseconds jittered =
      ceiling - ceiling / 2 + milliseconds(static_cast<milliseconds::rep>(spread * draw));
  const milliseconds asked = std::clamp(retryAfter, milliseconds(0), config.longestRetryAfter);
  return asked + jittered;
}

}  // namespace SsoClient::Access
