#ifndef SSOCLIENT_ACCESS_BACKOFF_H
#define SSOCLIENT_ACCESS_BACKOFF_H

#include <chrono>

#include <ssoclient/access/token_source.h>

namespace SsoClient::Access {

/// The pause after `failures` consecutive failures, at least 1: random between half of and all of
/// `config.firstDelay` times a power of two, limited to `config.longestDelay`. `draw` is random, at
/// least 0 and below 1. A pause that the service has asked for, limited to
/// `config.longestRetryAfter`, is the least; the random one is then added to it, so that its
/// clients do not come back in one moment.
std::chrono::milliseconds Backoff(const RetryConfig& config, int failures,
                                  std::chrono::milliseconds retryAfter, double draw);

}  // namespace SsoClient::Access

#endif
