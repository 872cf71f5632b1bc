// Measures what a token source with a thousand keys costs besides its exchanges, in virtual time
// and with a service that answers at once. Prints "refresh MICROSECONDS", the processor time to
// refresh one key in the best of several rounds, and "memory BYTES", the heap memory for a key
// without its token.
#include <algorithm>
#include <cstdio>
#include <ctime>
#include <exception>
#include <iostream>
#include <limits>
#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <malloc.h>

#include "core.h"
#include "simulation.h"
#include "support/issued_token.h"
#include "support/scripted_endpoint.h"

namespace Bench {
namespace {

using SsoClient::SamlToken;
using SsoClient::TokenSpec;
using SsoClient::Access::Core;
using std::chrono::hours;

namespace Testing = SsoClient::Access::Testing;

constexpr std::size_t kKeys = 1000;
constexpr int kRounds = 20;

std::size_t HeapInUse() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

std::shared_ptr<const SamlToken> MakeToken(const Simulation& simulation) {
  const auto start = std::chrono::duration_cast<std::chrono::microseconds>(
      simulation.Now().wall.time_since_epoch());
  return std::make_shared<Testing::IssuedToken>(
      "_1", start.count(), (start + std::chrono::microseconds(hours(1))).count());
}

/// Issues tokens of an hour at once.
class Client final : public SsoClient::Access::EndpointClient {
 public:
  Client(const Simulation& simulation, std::size_t& attempts)
      : simulation_(simulation), attempts_(attempts) {}

  const SsoClient::Access::Endpoint& Where() const override { return endpoint_; }
  SsoClient::Access::AttemptOutcome Attempt(const SsoClient::Access::AttemptRequest&,
                                            Tarnik::Http::CallLimit&) override {
    ++attempts_;
    return Testing::Issued(MakeToken(simulation_));
  }

 private:
  const Simulation& simulation_;
  std::size_t& attempts_;
  const SsoClient::Access::Endpoint endpoint_{"https://sts.example.com", ""};
};

class ThousandKeys {
 public:
  ThousandKeys() {
    SsoClient::Access::TokenSourceConfig config;
    config.login = SsoClient::Access::PasswordLogin{"orders", [] { return std::string("secret"); }};
    Core::Parts parts;
    parts.config = std::make_shared<const SsoClient::Access::TokenSourceConfig>(std::move(config));
    parts.runtime = CreateRuntime(simulation_, 1);
    parts.clients.push_back(std::make_unique<Client>(simulation_, attempts_));
    core_ = Core::Create(std::move(parts));
    for (std::size_t i = 0; i < kKeys; ++i) {
      TokenSpec spec;
      spec.tokenLifetimeSec = 3600;
      spec.audienceRestriction = {"https://service-" + std::to_string(i) + ".example.com",
                                  "https://replica-" + std::to_string(i) + ".example.com"};
      specs_.push_back(spec);
    }
  }

  double BytesPerKey() {
    // The first key fills what all share.
    Ask(specs_.front());
    const std::size_t before = HeapInUse();
    for (const TokenSpec& spec : specs_) {
      Ask(spec);
    }
    const std::size_t after = HeapInUse();
    std::vector<std::shared_ptr<const SamlToken>> tokens;
    tokens.reserve(kKeys);
    const std::size_t beforeTokens = HeapInUse();
    for (std::size_t i = 0; i < kKeys; ++i) {
      tokens.push_back(MakeToken(simulation_));
    }
    return static_cast<double>(after - before - (HeapInUse() - beforeTokens)) / kKeys;
  }

  double MicrosecondsPerRefresh() {
    double best = std::numeric_limits<double>::max();
    for (int round = 0; round < kRounds; ++round) {
      for (const TokenSpec& spec : specs_) {
        core_->TryGetToken(spec);
      }
      const std::size_t attemptsBefore = attempts_;
      const std::clock_t begin = std::clock();
      simulation_.PassUntil(simulation_.Now().steady + std::chrono::minutes(45));
      const auto time = static_cast<double>(std::clock() - begin) * 1e6 / CLOCKS_PER_SEC;
      if (attempts_ > attemptsBefore) {
        best = std::min(best, time / static_cast<double>(attempts_ - attemptsBefore));
      }
    }
    return best;
  }

 private:
  void Ask(const TokenSpec& spec) {
    core_->GetTokenAsync(spec, {},
                         [](const std::shared_ptr<const SamlToken>&, const Tarnik::Exception*) {});
    simulation_.PassUntil(simulation_.Now().steady);
  }

  Simulation simulation_;
  std::size_t attempts_ = 0;
  std::vector<TokenSpec> specs_;
  std::shared_ptr<Core> core_;
};

}  // namespace
}  // namespace Bench

int main() {
  try {
    Bench::ThousandKeys keys;
    const double bytes = keys.BytesPerKey();
    std::printf("refresh %.1f\nmemory %.0f\n", keys.MicrosecondsPerRefresh(), bytes);
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "token_refresh: " << e.what() << '\n';
    return 1;
  }
}
