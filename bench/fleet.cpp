#include "fleet.h"

#include <algorithm>
#include <array>
#include <memory>
#include <numeric>
#include <optional>
#include <random>
#include <string>
#include <utility>

#include "core.h"
#include "simulation.h"
#include "support/issued_token.h"
#include "support/scripted_endpoint.h"

namespace Bench {
namespace {

using SsoClient::SamlToken;
using SsoClient::TokenSpec;
using SsoClient::Access::AttemptOutcome;
using SsoClient::Access::AttemptRequest;
using SsoClient::Access::CallContext;
using SsoClient::Access::Core;
using SsoClient::Access::Endpoint;
using SsoClient::Access::TokenSourceConfig;
using std::chrono::microseconds;
using std::chrono::milliseconds;

namespace Testing = SsoClient::Access::Testing;

constexpr milliseconds kAnswerTime{50};
constexpr milliseconds kRefusalTime{1};
// How soon a sleeping attempt notices that nobody waits for it.
constexpr milliseconds kLook{500};

class Service {
 public:
  Service(Simulation& simulation, const FleetPlan& plan, bool dies)
      : simulation_(simulation),
        plan_(plan),
        begun_(simulation.Now().steady),
        dies_(dies),
        requests_(static_cast<std::size_t>(plan.duration / std::chrono::minutes(1)) + 60) {}

  AttemptOutcome Attempt(Tarnik::Http::CallLimit& limit) {
    ++requests_[static_cast<std::size_t>(Elapsed() / std::chrono::minutes(1))];
    if (IsUp()) {
      simulation_.Sleep(kAnswerTime);
      return Testing::Issued(NewToken());
    }
    ++attemptsWhileDown_;
    if (plan_.outage == Outage::kRefused) {
      simulation_.Sleep(kRefusalTime);
      return Testing::Unreachable();
    }
    while (simulation_.Now().steady < limit.Deadline() && !limit.IsCancelled()) {
      simulation_.Sleep(kLook);
    }
    return Testing::Failed<SsoClient::CommunicationException>(
        SsoClient::Access::FailureKind::kTimedOut, "No answer.");
  }

  const std::vector<std::uint32_t>& Requests() const { return requests_; }
  std::uint64_t AttemptsWhileDown() const { return attemptsWhileDown_; }

 private:
  Simulation::Time::duration Elapsed() const { return simulation_.Now().steady - begun_; }
  bool IsUp() const { return !dies_ || Elapsed() < plan_.death || Elapsed() >= plan_.comeback; }

  std::shared_ptr<const SamlToken> NewToken() {
    const auto start =
        std::chrono::duration_cast<microseconds>(simulation_.Now().wall.time_since_epoch());
    return std::make_shared<Testing::IssuedToken>("_" + std::to_string(++tokens_), start.count(),
                                                  (start + plan_.lifetime).count());
  }

  Simulation& simulation_;
  const FleetPlan& plan_;
  const Simulation::Time begun_;
  const bool dies_;
  std::vector<std::uint32_t> requests_;
  std::uint64_t attemptsWhileDown_ = 0;
  std::uint64_t tokens_ = 0;
};

class Client final : public SsoClient::Access::EndpointClient {
 public:
  Client(Endpoint endpoint, Service& service) : endpoint_(std::move(endpoint)), service_(service) {}

  const Endpoint& Where() const override { return endpoint_; }
  AttemptOutcome Attempt(const AttemptRequest&, Tarnik::Http::CallLimit& limit) override {
    return service_.Attempt(limit);
  }

 private:
  const Endpoint endpoint_;
  Service& service_;
};

TokenSpec MakeSpec(const FleetPlan& plan) {
  TokenSpec spec;
  spec.tokenLifetimeSec = plan.lifetime.count();
  spec.audienceRestriction = {"https://orders.example.com"};
  return spec;
}

/// A server, whose calls come at random.
class Server {
 public:
  Server(Simulation& simulation, const FleetPlan& plan, FleetReport& report, Core::Parts parts,
         Simulation::Time begun, std::uint64_t seed)
      : simulation_(simulation),
        plan_(plan),
        report_(report),
        spec_(MakeSpec(plan)),
        core_(Core::Create(std::move(parts))),
        random_(seed),
        begun_(begun) {}

  void ScheduleCall() {
    std::exponential_distribution<double> distance(1.0 / plan_.betweenCalls.count());
    const auto wait =
        std::chrono::duration_cast<microseconds>(std::chrono::duration<double>(distance(random_)));
    simulation_.At(simulation_.Now().steady + wait, [this] { Call(); });
  }
  /// No more calls.
  void End() { hasEnded_ = true; }

 private:
  void Call() {
    if (hasEnded_) {
      return;
    }
    ScheduleCall();
    ++report_.calls;
    const auto elapsed = simulation_.Now().steady - begun_;
    report_.callsDuringOutage += elapsed >= plan_.death && elapsed < plan_.comeback ? 1 : 0;
    if (core_->TryGetToken(spec_) != nullptr) {
      Succeed();
      return;
    }
    ++report_.callsThatWaited;
    const Simulation::Time begun = simulation_.Now().steady;
    CallContext context;
    context.deadline = begun + plan_.patience;
    core_->GetTokenAsync(
        spec_, context,
        [this, begun](const std::shared_ptr<const SamlToken>& token, const Tarnik::Exception*) {
          Finish(begun, token != nullptr);
        });
  }

  void Finish(Simulation::Time begun, bool hasToken) {
    report_.longestWait = std::max(report_.longestWait, Since(begun));
    if (hasToken) {
      Succeed();
      return;
    }
    ++report_.callsWithoutToken;
    if (!withoutTokenSince_) {
      withoutTokenSince_ = begun;
    }
  }

  void Succeed() {
    if (const auto since = std::exchange(withoutTokenSince_, std::nullopt)) {
      report_.longestWithoutToken = std::max(report_.longestWithoutToken, Since(*since));
    }
  }

  milliseconds Since(Simulation::Time time) const {
    return std::chrono::duration_cast<milliseconds>(simulation_.Now().steady - time);
  }

  Simulation& simulation_;
  const FleetPlan& plan_;
  FleetReport& report_;
  const TokenSpec spec_;
  const std::shared_ptr<Core> core_;
  Random random_;
  const Simulation::Time begun_;  ///< of the simulation
  std::optional<Simulation::Time> withoutTokenSince_;
  bool hasEnded_ = false;
};

using Order = std::array<std::size_t, kServices>;

std::shared_ptr<const TokenSourceConfig> MakeConfig(const FleetPlan& plan, const Order& order) {
  TokenSourceConfig config;
  for (const std::size_t index : order) {
    config.endpoints.push_back({"https://sts" + std::to_string(index) + ".example.com", ""});
  }
  config.login = SsoClient::Access::PasswordLogin{"orders", [] { return std::string("secret"); }};
  config.refresh = plan.refresh;
  config.retry = plan.retry;
  return std::make_shared<const TokenSourceConfig>(std::move(config));
}

class Fleet {
 public:
  explicit Fleet(const FleetPlan& plan) : plan_(plan) {
    for (std::size_t i = 0; i < kServices; ++i) {
      services_[i] = std::make_unique<Service>(simulation_, plan_, i < plan_.dying);
    }
    Order order{};
    std::iota(order.begin(), order.end(), 0U);
    do {
      orders_.push_back(order);
      configs_.push_back(MakeConfig(plan_, order));
    } while (std::next_permutation(order.begin(), order.end()));
  }

  FleetReport Run() {
    for (std::size_t i = 0; i < plan_.servers; ++i) {
      simulation_.At(begun_ + plan_.start * i / plan_.servers, [this, i] { StartServer(i); });
    }
    simulation_.PassUntil(begun_ + plan_.duration);
    for (const auto& server : servers_) {
      server->End();
    }
    simulation_.Settle();
    for (std::size_t i = 0; i < kServices; ++i) {
      report_.requests[i] = services_[i]->Requests();
      report_.attemptsAtDead += services_[i]->AttemptsWhileDown();
      report_.requests[i].resize(
          static_cast<std::size_t>(plan_.duration / std::chrono::minutes(1)));
    }
    return report_;
  }

 private:
  void StartServer(std::size_t number) {
    const std::size_t list = plan_.order == ListOrder::kShuffled ? number % orders_.size() : 0;
    Core::Parts parts;
    parts.config = configs_[list];
    parts.runtime = CreateRuntime(simulation_, 2 * number + 1);
    for (std::size_t i = 0; i < kServices; ++i) {
      parts.clients.push_back(
          std::make_unique<Client>(parts.config->endpoints[i], *services_[orders_[list][i]]));
    }
    servers_.push_back(std::make_unique<Server>(simulation_, plan_, report_, std::move(parts),
                                                begun_, 2 * number + 2));
    servers_.back()->ScheduleCall();
  }

  const FleetPlan& plan_;
  FleetReport report_;
  Simulation simulation_;
  const Simulation::Time begun_ = simulation_.Now().steady;
  std::array<std::unique_ptr<Service>, kServices> services_;
  std::vector<Order> orders_;
  std::vector<std::shared_ptr<const TokenSourceConfig>> configs_;
  std::vector<std::unique_ptr<Server>> servers_;
};

}  // namespace

FleetReport SimulateFleet(const FleetPlan& plan) {
  return Fleet(plan).Run();
}

}  // namespace Bench
