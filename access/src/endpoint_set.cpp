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

}  // namespace

EndpointSet::EndpointSet(const RetryConfig& config,
                         std::vector<std::unique_ptr<EndpointClient>> clients) {
  for (auto& client : clients) {
    members_.push_back({std::move(client), Circuit(config), {}, milliseconds(0), false});
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

bool EndpointSet::CanAdmit(const Asked& asked, Instant::Steady now) const {
  for (Index index = 0; index < Size(); ++index) {
    if (!asked[index] && members_[index].circuit.CanAdmit(now)) {
      return true;
    }
  }
  return false;
}

EndpointSet::Admission EndpointSet::Admit(const Asked& asked, Instant::Steady now, Order order) {
  for (std::size_t n = 0; n < Size(); ++n) {
    const Index index = Nth(n, order);
    const CircuitState before = members_[index].circuit.State();
    if (!asked[index] && members_[index].circuit.Admit(now)) {
      return {index, ChangeSince(before, index, now)};
    }
  }
  return {};
}

EndpointSet::Change EndpointSet::OnAnswer(Index index, bool isPreferred) {
  Member& member = members_[index];
  const CircuitState before = member.circuit.State();
  member.circuit.OnAnswer();
  if (isPreferred) {
    preferred_ = index;
  }
  return ChangeSince(before, index, {});
}

EndpointSet::Change EndpointSet::OnFailure(Index index, const std::string& reason,
                                           milliseconds retryAfter, Instant::Steady now,
                                           double draw) {
  Member& member = members_[index];
  const CircuitState before = member.circuit.State();
  member.lastReason = reason;
  member.circuit.OnFailure(now, retryAfter, draw);
  return ChangeSince(before, index, now);
}

EndpointSet::Change EndpointSet::OnAbandoned(Index index, bool hasWaitedInVain) {
  Member& member = members_[index];
  const CircuitState before = member.circuit.State();
  member.circuit.OnAbandoned();
  if (hasWaitedInVain && preferred_ == index) {
    preferred_ = (index + 1) % Size();
  }
  return ChangeSince(before, index, {});
}

boost::optional<Instant::Steady> EndpointSet::ClosedAdmission() const {
  boost::optional<Instant::Steady> earliest;
  for (const Member& member : members_) {
    if (member.circuit.State() == CircuitState::kClosed) {
      earliest =
          earliest ? std::min(*earliest, member.circuit.RetryAt()) : member.circuit.RetryAt();
    }
  }
  return earliest;
}

Instant::Steady EndpointSet::EarliestAdmission() const {
  Instant::Steady earliest = Instant::Steady::max();
  for (const Member& member : members_) {
    earliest = std::min(earliest, member.circuit.RetryAt());
  }
  return earliest;
}

std::string EndpointSet::WhyLeftOut(Index index, Instant::Steady now) const {
  const Member& member = members_[index];
  if (member.circuit.State() == CircuitState::kHalfOpen) {
    return "left out while another call probes it; it failed before: " + member.lastReason;
  }
  return "left out for another " + std::to_string(Until(member.circuit.RetryAt(), now).count()) +
         " ms; it failed before: " + member.lastReason;
}

bool EndpointSet::SetClockOffset(Index index, milliseconds offset) {
  Member& member = members_[index];
  member.clockOffset = offset;
  const bool isWrong = offset > kLargestOffset || offset < -kLargestOffset;
  return std::exchange(member.isClockWrong, isWrong) != isWrong;
}

EndpointSet::Change EndpointSet::ChangeSince(CircuitState before, Index index,
                                             Instant::Steady now) const {
  const Circuit& circuit = members_[index].circuit;
  if (circuit.State() == before) {
    return boost::none;
  }
  CircuitRecord record;
  record.endpoint = Url(index);
  record.state = circuit.State();
  if (record.state == CircuitState::kOpen && now != Instant::Steady()) {
    record.retryAfter = Until(circuit.RetryAt(), now);
  }
  return record;
}

}  // namespace SsoClient::Access
