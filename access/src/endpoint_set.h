#ifndef SSOCLIENT_ACCESS_ENDPOINT_SET_H
#define SSOCLIENT_ACCESS_ENDPOINT_SET_H

#include <chrono>
#include <cstddef>
#include <memory>
#include <optional>
#include <string>
#include <vector>

#include <boost/optional.hpp>

#include "attempt.h"
#include "circuit.h"
#include "failure.h"

namespace SsoClient::Access {

/// The endpoints of a source, each with its circuit, and with places for the attempts that may be
/// under way at once. The preferred one is asked first: the one that answered last, at first the
/// first. A refresh that is in no hurry asks them in the listed order, so that the source returns
/// to the first one. Not thread-safe.
class EndpointSet {
 public:
  using Index = std::size_t;
  /// Whether a request has asked each endpoint in its current round.
  using Asked = std::vector<bool>;
  struct NewState {
    Index endpoint;
    CircuitState state;
    std::chrono::milliseconds retryAfter;  ///< for an open circuit, until the next probe
  };
  /// The new state of a circuit; not set when it has not changed.
  using Change = boost::optional<NewState>;
  enum class Order { kPreferredFirst, kAsListed };

  EndpointSet(const RetryConfig& config, std::vector<std::unique_ptr<EndpointClient>> clients);

  std::size_t Size() const noexcept { return members_.size(); }
  EndpointClient& Client(Index index) const { return *members_[index].client; }
  const std::string& Url(Index index) const { return Client(index).Where().url; }

  /// True when an endpoint that is not in `asked` may be asked, with or without a free place.
  bool CanAdmit(const Asked& asked, Instant::Steady now) const noexcept;
  bool CanAdmit(Index index, Instant::Steady now) const noexcept {
    return members_[index].circuit.CanAdmit(now);
  }
  /// True when an endpoint that may be asked has a free place.
  bool HasPlace(Instant::Steady now) const noexcept;
  /// Takes a place at the next endpoint that is not in `asked`, may be asked and has one. Not set
  /// when no endpoint has one.
  std::optional<Index> TakePlace(const Asked& asked, Instant::Steady now,
                                 Order order = Order::kPreferredFirst) noexcept;
  void ReturnPlace(Index index) noexcept { --members_[index].underWay; }

  /// An attempt begins at an endpoint that may be asked. Its outcome must be reported.
  Change Begin(Index index, Instant::Steady now) noexcept;
  /// The endpoint has answered, which closes the circuit, and is preferred now if it `isPreferred`.
  Change OnAnswer(Index index, bool isPreferred = true) noexcept;
  /// Another endpoint is preferred then.
  Change OnFailure(Index index, const Reason& reason, std::chrono::milliseconds retryAfter,
                   Instant::Steady now, double draw) noexcept;
  /// The endpoint has failed in a way that may concern this operation only.
  Change OnUnclear(Index index, const Reason& reason, std::chrono::milliseconds retryAfter,
                   Instant::Steady now, double draw) noexcept;
  /// The attempt ended before the endpoint did anything.
  Change OnAbandoned(Index index) noexcept;
  /// Another endpoint is preferred until this one answers.
  void AskLast(Index index) noexcept {
    preferred_ = preferred_ == index ? (index + 1) % Size() : preferred_;
  }

  /// When an endpoint that nobody probes may be asked; not set when no circuit is closed.
  boost::optional<Instant::Steady> NextAdmission() const noexcept;
  /// When any endpoint may be asked.
  Instant::Steady EarliestAdmission() const noexcept;
  /// Why an endpoint is left out, with its last failure.
  std::string WhyLeftOut(Index index, Instant::Steady now) const;

  /// The offset of the endpoint's clock that was seen last; zero before.
  std::chrono::milliseconds ClockOffset(Index index) const { return members_[index].clockOffset; }
  /// Notes an offset; true when the clock began or ceased to be wrong.
  bool SetClockOffset(Index index, std::chrono::milliseconds offset) noexcept;

 private:
  struct Member {
    std::unique_ptr<EndpointClient> client;
    Circuit circuit;
    std::size_t underWay = 0;
    Reason lastReason;
    std::chrono::milliseconds clockOffset{0};
    bool isClockWrong = false;
  };

  Index Nth(std::size_t n, Order order) const noexcept;
  Change ChangeSince(CircuitState before, Index index, Instant::Steady now) const noexcept;

  std::vector<Member> members_;
  const std::size_t places_;  ///< of each endpoint
  Index preferred_ = 0;
};

}  // namespace SsoClient::Access

#endif
