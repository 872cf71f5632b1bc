// For the demo: several threads use one token source with two services, and the first service is
// killed in the middle. Prints what the callers and the listener have seen, and ends with status 1
// when a call has failed.
#include <algorithm>
#include <atomic>
#include <chrono>
#include <condition_variable>
#include <csignal>
#include <iomanip>
#include <iostream>
#include <map>
#include <memory>
#include <mutex>
#include <string>
#include <thread>
#include <vector>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

namespace {

using SsoClient::Access::AttemptRecord;
using SsoClient::Access::CircuitState;
using SsoClient::Access::FailureKind;
using Milliseconds = std::chrono::duration<double, std::milli>;

constexpr int kThreads = 4;
constexpr int kCalls = 240;
constexpr int kCallOfTheKill = 80;
constexpr int kAudiences = 7;

/// What has happened at one endpoint.
struct Happened {
  int tokens = 0;
  std::map<std::string, int> failures;
  std::string circuit;
};

class Tally final : public SsoClient::Access::AccessListener {
 public:
  void OnAttemptBegun(const AttemptRecord&) override {
    const std::lock_guard lock(mutex_);
    ++underWay_;
  }
  void OnAttemptEnded(const AttemptRecord& attempt) override {
    const std::lock_guard lock(mutex_);
    Happened& happened = happened_[attempt.endpoint];
    if (attempt.failure == FailureKind::kNone) {
      ++happened.tokens;
    } else {
      ++happened.failures[NameOf(attempt.failure)];
    }
    --underWay_;
    ended_.notify_all();
  }
  void OnCircuit(const SsoClient::Access::CircuitRecord& circuit) override {
    const std::lock_guard lock(mutex_);
    happened_[circuit.endpoint].circuit += circuit.state == CircuitState::kOpen     ? " opened"
                                           : circuit.state == CircuitState::kClosed ? " closed"
                                                                                    : " half-open";
  }

  /// What has happened by the time at which no attempt is under way.
  std::map<std::string, Happened> Await() {
    std::unique_lock lock(mutex_);
    ended_.wait(lock, [this] { return underWay_ == 0; });
    return happened_;
  }

 private:
  std::mutex mutex_;
  std::condition_variable ended_;
  int underWay_ = 0;
  std::map<std::string, Happened> happened_;
};

/// The calls of all threads.
struct Load {
  SsoClient::Access::TokenSource& source;
  pid_t firstService;
  std::atomic<int> begun{0};
  std::atomic<int> failed{0};
  std::mutex mutex{};
  Milliseconds longest{0};
};

void Call(Load& load, int number) {
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  spec.audienceRestriction = {"https://" + std::to_string(number % kAudiences) + ".example.com"};
  const auto begin = std::chrono::steady_clock::now();
  try {
    const auto token = load.source.GetToken(
        spec, SsoClient::Access::CallContext::Within(std::chrono::seconds(20)));
    const Milliseconds duration = std::chrono::steady_clock::now() - begin;
    {
      const std::lock_guard lock(load.mutex);
      load.longest = std::max(load.longest, duration);
    }
    // As if a server had refused every second token, so that there is something to do.
    if (number % 2 == 0) {
      load.source.Invalidate(*token);
    }
  } catch (const Tarnik::Exception& e) {
    ++load.failed;
    std::cerr << "call " + std::to_string(number) + ": " + e.what() + '\n';
  }
}

void RunThread(Load& load) {
  for (int number = load.begun++; number < kCalls; number = load.begun++) {
    if (number == kCallOfTheKill) {
      kill(load.firstService, SIGKILL);
    }
    Call(load, number);
  }
}

void RunThreads(Load& load) {
  std::vector<std::thread> threads;
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&load] { RunThread(load); });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
}

void PrintRow(const char* name, const Happened& happened) {
  std::string failures;
  for (const auto& [kind, count] : happened.failures) {
    failures += (failures.empty() ? "" : ", ") + std::to_string(count) + ' ' + kind;
  }
  std::cout << std::left << std::setw(18) << name << std::right << std::setw(6) << happened.tokens
            << "   " << std::left << std::setw(32) << (failures.empty() ? "none" : failures) << "  "
            << (happened.circuit.empty() ? "unchanged" : happened.circuit.substr(1)) << '\n';
}

SsoClient::Access::TokenSourceConfig ConfigFrom(char** argv) {
  std::string password;
  std::getline(std::cin, password);
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[1]};
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[2]));
  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{argv[4]}, {argv[5]}};
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  config.login = SsoClient::Access::PasswordLogin{argv[3], [=] { return password; }};
  config.retry.failuresToOpen = 1;
  return config;
}

}  // namespace

int main(int argc, char** argv) try {
  if (argc != 7) {
    std::cerr
        << "usage: serve_under_load CA_FILE STS_CERTIFICATE_FILE USER URL URL PID_OF_THE_FIRST"
           " < password\n";
    return 2;
  }
  const auto tally = std::make_shared<Tally>();
  auto config = ConfigFrom(argv);
  config.listener = tally;
  const auto source = SsoClient::Access::CreateTokenSource(config);
  Load load{*source, std::stoi(argv[6])};
  RunThreads(load);

  auto happened = tally->Await();
  const auto metrics = source->Metrics();
  std::cout << "service           tokens   failed attempts                   circuit\n";
  PrintRow("first, killed", happened[argv[4]]);
  PrintRow("second", happened[argv[5]]);
  std::cout << kCalls << " calls by " << kThreads << " threads: " << load.failed << " failed, "
            << metrics.hits << " answered from the cache; the longest took " << std::fixed
            << std::setprecision(0) << load.longest.count() << " ms\n";
  return load.failed == 0 ? 0 : 1;
} catch (const std::exception& e) {
  std::cerr << "serve_under_load: " << e.what() << '\n';
  return 1;
}
