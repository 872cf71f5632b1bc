#include "endpoint_set.h"

#include <algorithm>
#include <utility>

namespace SsoClient::Access {

namespace {

using std::chrono::milliseconds;

constexpr milliseconds kLargestOffset = std::chrono::seconds(30);

milliseconds Until(Instant::Steady time, Instant::Steady now) {
  return std::max(std::chrono::ceil<milliseconds>(time - now), milliseconds(0));
}

// Each endpoint has a share of its own, so that those that are silent leave room for the others.
std::size_t PlacesOfEach(const RetryConfig& config, std::size_t endpoints) {
  const auto all = static_cast<std::size_t>(config.attemptsAtOnce);
  return std::max<std::size_t>(all / std::max<std::size_t>(endpoints, 1), 1);
}

}  // namespace

EndpointSet::EndpointSet(const RetryConfig& config,
                         std::vector<std::unique_ptr<EndpointClient>> clients)
    : places_(PlacesOfEach(config, clients.size())) {
  for (auto& client : clients) {
    members_.push_back({std::move(client), Circuit(config), 0, {}, milliseconds(0), false});
  }
}

EndpointSet::Index EndpointSet::Nth(std::size_t n, Order order) const noexcept {
  if (order == Order::kAsListed) {
    return n;
  }
  if (n == 0) {
    return preferred_;
  }
  return n <= preferred_ ? n - 1 : n;
}

bool EndpointSet::CanAdmit(const Asked& asked, Instant::Steady now) const noexcept {
  for (Index index = 0; index < Size(); ++index) {
    if (!asked[index] && members_[index].circuit.CanAdmit(now)) {
      return true;
    }
  }
  return false;
}

bool EndpointSet::HasPlace(Instant::Steady now) const noexcept {
  return std::any_of(members_.begin(), members_.end(), [&](const Member& member) {
    return member.underWay < places_ && member.circuit.CanAdmit(now);
  });
}

std::optional<EndpointSet::Index> EndpointSet::TakePlace(const Asked& asked, Instant::Steady now,
                                                         Order order) noexcept {
  for (std::size_t n = 0; n < Size(); ++n) {
    const Index index = Nth(n, order);
    Member& member = members_[index];
    if (!asked[index] && member.underWay < places_ && member.circuit.CanAdmit(now)) {
      ++member.underWay;
      return index;
    }
  }
  return std::nullopt;
}

EndpointSet::Change EndpointSet::Begin(Index index, Instant::Steady now) noexcept {
  const CircuitState before = members_[index].circuit.State();
  members_[index].circuit.Admit(now);
  return ChangeSince(before, index, now);
}

EndpointSet::Change EndpointSet::OnAnswer(Index index, bool isPreferred) noexcept {
  Member& member = members_[index];
  const CircuitState before = member.circuit.State();
  member.circuit.OnAnswer();
  if (isPreferred) {
    preferred_ = index;
  }
  return ChangeSince(before, index, {});
}

EndpointSet::Change EndpointSet::OnFailure(Index index, const Reason& reason,
                                           milliseconds retryAfter, Instant::Steady now,
                                           double draw) noexcept {
  Member& member = members_[index];
  const CircuitState before = member.circuit.State();
  member.lastReason = reason;
  member.circuit.OnFailure(now, retryAfter, draw);
  AskLast(index);
  return ChangeSince(before, index, now);
}

EndpointSet::Change EndpointSet::OnUnclear(Index index, const Reason& reason,
                                           milliseconds retryAfter, Instant::Steady now,
                                           double draw) noexcept {
  Member& member = members_[index];
  const CircuitState before = member.circuit.State();
  member.lastReason = reason;
  member.circuit.OnUnclear(now, retryAfter, draw);
  return ChangeSince(before, index, now);
}

EndpointSet::Change EndpointSet::OnAbandoned(Index index) noexcept {
  Member& member = members_[index];
  const CircuitState before = member.circuit.State();
  member.circuit.OnAbandoned();
  return ChangeSince(before, index, {});
}

boost::optional<Instant::Steady> EndpointSet::NextAdmission() const noexcept {
  Instant::Steady earliest = Instant::Steady::max();
  bool isAnyClosed = false;
  for (const Member& member : members_) {
    const CircuitState state = member.circuit.State();
    isAnyClosed |= state == CircuitState::kClosed;
    if (state != CircuitState::kHalfOpen) {
      earliest = std::min(earliest, member.circuit.RetryAt());
    }
  }
  return boost::make_optional(isAnyClosed, earliest);
}

Instant::Steady EndpointSet::EarliestAdmission() const noexcept {
  Instant::Steady earliest = Instant::Steady::max();
  for (const Member& member : members_) {
    earliest = std::min(earliest, member.circuit.RetryAt());
  }
  return earliest;
}

std::string EndpointSet::WhyLeftOut(Index index, Instant::Steady now) const {
  const Member& member = members_[index];
  if (member.circuit.State() == CircuitState::kHalfOpen) {
    return "left out while another call probes it; it failed before: " +
           member.lastReason.ToString();
  }
  const auto left = std::chrono::ceil<std::chrono::seconds>(member.circuit.RetryAt() - now);
  return "left out for another " + std::to_string(std::max<std::int64_t>(left.count(), 0)) +
         " s; it failed before: " + member.lastReason.ToString();
}

bool EndpointSet::SetClockOffset(Index index, milliseconds offset) noexcept {
  Member& member = members_[index];
  member.clockOffset = offset;
  const bool isWrong = offset > kLargestOffset || offset < -kLargestOffset;
  return std::exchange(member.isClockWrong, isWrong) != isWrong;
}

EndpointSet::Change EndpointSet::ChangeSince(CircuitState before, Index index,
                                             Instant::Steady now) const noexcept {
  const Circuit& circuit = members_[index].circuit;
  if (circuit.State() == before) {
    return boost::none;
  }
  const bool isTimed = circuit.State() == CircuitState::kOpen && now != Instant::Steady();
  return NewState{index, circuit.State(),
                  isTimed ? Until(circuit.RetryAt(), now) : milliseconds(0)};
}

}  // namespace SsoClient::Access
