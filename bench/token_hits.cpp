// Measures a call of a token source that is answered from the cache. Prints for each kind of spec
// "hit NAME NANOSECONDS ALLOCATIONS", and then "threads NANOSECONDS RATIO": the time of a call
// while another thread makes calls as well, and the calls of two threads divided by those of one in
// the same time, and "clocks NANOSECONDS": the time to read the two clocks that each call reads.
// The kinds are measured in turn, and the best round of each counts.
#include <algorithm>
#include <array>
#include <barrier>
#include <chrono>
#include <cstdio>
#include <exception>
#include <iostream>
#include <limits>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <devsts/server.h>
#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

#include "allocation_count.h"

namespace Bench {
namespace {

using Clock = std::chrono::steady_clock;
using SsoClient::TokenSpec;
using SsoClient::Access::TokenSource;

constexpr char kUser[] = "alice@EXAMPLE.COM";
constexpr int kRounds = 300;
constexpr std::size_t kHits =
    4'000;  // so few that a round is over before the thread is interrupted
constexpr std::size_t kKeys = 1000;

/// Specs that are asked for in turn.
struct Kind {
  std::string name;
  std::vector<TokenSpec> specs;
  double best = std::numeric_limits<double>::max();
  std::size_t allocations = 0;
};

DevSts::ServerOptions OptionsOfServer() {
  DevSts::ServerOptions options;
  options.users = DevSts::DemoUsers();
  // So many groups that a token has about 6 KB.
  for (int group = 0; group < 45; ++group) {
    options.users["bob@EXAMPLE.COM"].groups.push_back("EXAMPLE\\group-" +
                                                      std::to_string(10000 + group));
  }
  return options;
}

std::shared_ptr<TokenSource> MakeSource(const DevSts::Server& server, const std::string& user,
                                        const std::string& password) {
  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{server.HttpUrl(), ""}};
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(nullptr);  // hits verify nothing
  config.login = SsoClient::Access::PasswordLogin{user, [password] { return password; }};
  config.cache.capacity = 2 * kKeys;
  return SsoClient::Access::CreateTokenSource(config);
}

TokenSpec SpecFor(std::size_t audiences, std::size_t number = 0) {
  TokenSpec spec;
  spec.tokenLifetimeSec = 24L * 3600;
  for (std::size_t i = 0; i < audiences; ++i) {
    spec.audienceRestriction.insert("https://service-" + std::to_string(number + i) +
                                    ".example.com");
  }
  return spec;
}

TokenSpec SpecActingAs(const std::shared_ptr<const SsoClient::SamlToken>& token) {
  TokenSpec spec = SpecFor(2);
  spec.actAsToken = token;
  return spec;
}

std::vector<Kind> MakeKinds(const DevSts::Server& server) {
  TokenSpec delegated = SpecFor(0);
  delegated.delegable = true;
  delegated.delegateTo = kUser;
  const auto user = MakeSource(server, "bob@EXAMPLE.COM", "bob-secret")->GetToken(delegated);
  const auto copy = SsoClient::CreateSamlToken(user->Xml());
  std::vector<TokenSpec> manySpecs;
  for (std::size_t number = 0; number < kKeys; ++number) {
    // Neighbours in time are no neighbours in memory.
    manySpecs.push_back(SpecFor(2, 1000 + number * 617 % kKeys));
  }
  return {{"2_audiences", {SpecFor(2)}},
          {"10_audiences", {SpecFor(10)}},
          {"act_as", {SpecActingAs(user)}},
          {"act_as_copy", {SpecActingAs(copy)}},
          {"1000_keys", std::move(manySpecs)}};
}

double NanosecondsPerHit(TokenSource& source, const std::vector<TokenSpec>& specs) {
  const auto begin = Clock::now();
  std::size_t next = 0;
  for (std::size_t i = 0; i < kHits; ++i) {
    source.GetToken(specs[next]);
    next = next + 1 == specs.size() ? 0 : next + 1;
  }
  return std::chrono::duration<double, std::nano>(Clock::now() - begin).count() / kHits;
}

void Measure(TokenSource& source, Kind& kind) {
  const std::size_t before = CountAllocations();
  kind.best = std::min(kind.best, NanosecondsPerHit(source, kind.specs));
  kind.allocations = std::max(kind.allocations, (CountAllocations() - before + kHits - 1) / kHits);
}

double NanosecondsOfTwoClocks() {
  const auto begin = Clock::now();
  for (std::size_t i = 0; i < kHits; ++i) {
    // Calls into the C++ library, which the compiler does not leave out.
    std::chrono::steady_clock::now();
    std::chrono::system_clock::now();
  }
  return std::chrono::duration<double, std::nano>(Clock::now() - begin).count() / kHits;
}

/// The time of a call on each of two threads that begin together; the longer one.
double NanosecondsPerHitOfTwo(TokenSource& source, const std::vector<TokenSpec>& specs) {
  std::barrier ready(2);
  std::array<double, 2> times{};
  const auto run = [&](std::size_t index) {
    source.GetToken(specs.front());
    ready.arrive_and_wait();
    times[index] = NanosecondsPerHit(source, specs);
  };
  std::thread other(run, 1);
  run(0);
  other.join();
  return std::max(times[0], times[1]);
}

void Run() {
  const DevSts::Server server(OptionsOfServer());
  const auto source = MakeSource(server, kUser, "secret");
  std::vector<Kind> kinds = MakeKinds(server);
  for (const Kind& kind : kinds) {
    for (const TokenSpec& spec : kind.specs) {
      source->GetToken(spec);
    }
  }
  double bestOfTwo = std::numeric_limits<double>::max();
  double clocks = std::numeric_limits<double>::max();
  for (int round = 0; round < kRounds; ++round) {
    for (Kind& kind : kinds) {
      Measure(*source, kind);
    }
    bestOfTwo = std::min(bestOfTwo, NanosecondsPerHitOfTwo(*source, kinds.front().specs));
    clocks = std::min(clocks, NanosecondsOfTwoClocks());
  }
  for (const Kind& kind : kinds) {
    std::printf("hit %s %.1f %zu\n", kind.name.c_str(), kind.best, kind.allocations);
  }
  std::printf("threads %.1f %.2f\n", bestOfTwo, 2 * kinds.front().best / bestOfTwo);
  std::printf("clocks %.1f\n", clocks);
}

}  // namespace
}  // namespace Bench

int main() {
  try {
    Bench::Run();
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "token_hits: " << e.what() << '\n';
    return 1;
  }
}
