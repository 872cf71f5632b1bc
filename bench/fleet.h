#ifndef BENCH_FLEET_H
#define BENCH_FLEET_H

#include <array>
#include <chrono>
#include <cstddef>
#include <cstdint>
#include <vector>

#include <ssoclient/access/token_source.h>

namespace Bench {

constexpr std::size_t kServices = 3;

/// How the servers list the endpoints.
enum class ListOrder {
  kSame,      ///< all in the same order
  kShuffled,  ///< each in an order of its own
};

/// What an attempt meets while a service is down.
enum class Outage {
  kRefused,  ///< its host refuses connections at once
  kSilent,   ///< nothing answers, until the limit of the attempt
};

/// Servers with one token source each, and three services, of which the first ones die and come
/// back.
struct FleetPlan {
  std::size_t servers = 10'000;
  std::chrono::hours duration{7 * 24};
  std::size_t dying = 1;
  std::chrono::minutes death = std::chrono::hours(3 * 24);
  std::chrono::minutes comeback = std::chrono::hours(3 * 24 + 4);
  Outage outage = Outage::kSilent;
  ListOrder order = ListOrder::kShuffled;
  SsoClient::Access::RefreshConfig refresh;
  SsoClient::Access::RetryConfig retry;
  std::chrono::seconds lifetime{3600};
  /// All servers start within this time.
  std::chrono::seconds start{60};
  /// The mean time between the calls of a server, which come at random (a Poisson process).
  std::chrono::seconds betweenCalls{300};
  /// How long a call waits.
  std::chrono::milliseconds patience{10'000};
};

struct FleetReport {
  /// The requests that reached each service, or its dead host, by minute.
  std::array<std::vector<std::uint32_t>, kServices> requests;
  std::uint64_t attemptsAtDead = 0;
  std::uint64_t calls = 0;
  std::uint64_t callsDuringOutage = 0;
  std::uint64_t callsThatWaited = 0;
  std::chrono::milliseconds longestWait{0};
  std::uint64_t callsWithoutToken = 0;
  /// From the first failed call of a server to its next successful one.
  std::chrono::milliseconds longestWithoutToken{0};
};

/// Simulates the fleet with the engine of the token sources. The same plan has the same result.
FleetReport SimulateFleet(const FleetPlan& plan);

}  // namespace Bench

#endif
