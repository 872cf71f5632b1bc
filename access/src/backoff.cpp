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
  const auto ceiling = static_cast<double>(Ceiling(config, failures).count());
  const milliseconds jittered(static_cast<milliseconds::rep>(ceiling * draw));
  const milliseconds asked = std::clamp(retryAfter, milliseconds(0), config.longestRetryAfter);
  return asked + jittered;
}

}  // namespace SsoClient::Access
