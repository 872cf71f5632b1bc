// Campaigns with programs that end, fork, or load and unload the libraries. The STS is in this
// process and the calls are in the others.
#include <chrono>
#include <string>
#include <vector>

#include "chaos/campaigns.h"
#include "chaos/peer.h"
#include "chaos/process_state.h"
#include "integration/holder_of_key_fixture.h"
#include "support/child_process.h"
#include "support/temporary_file.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;

/// Runs a program that ends with status 0, and kills it when it has not ended after 50 seconds.
void RunProgram(const Run& run, std::vector<std::string> command, bool isLeakCheckOff) {
  const int status = Tarnik::Testing::RunToEnd(std::move(command),
                                               {.limit = 50s, .isLeakCheckOff = isLeakCheckOff});
  run.Require(status == 0, "the program ended with status " + std::to_string(status));
}

/// What a probe needs of the STS.
struct ProbeFiles {
  explicit ProbeFiles(const DevSts::Server& sts)
      : ca(sts.CaCertificatePem()), signing(sts.SigningCertificatePem()) {}

  const Tarnik::Testing::TemporaryFile ca;
  const Tarnik::Testing::TemporaryFile signing;
};

struct Scenario {
  const char* name;
  bool isSilent;
};

constexpr Scenario kExits[] = {
    {"async", false},
    {"async", true},
    {"join", true},
    {"call-in-handler", false},
    {"call-in-handler", true},
    {"async-call-in-handler", false},
    {"callback-in-handler", true},
};

// The allocator of AddressSanitizer remains locked in a child when another thread allocates during
// the fork.
#ifdef __SANITIZE_ADDRESS__
constexpr int kThreadsInCalls = 0;
#else
constexpr int kThreadsInCalls = 32;
#endif

constexpr const char* kForks[] = {"call",          "sign",          "exit",
                                  "call-and-exit", "grandchildren", "callback"};

}  // namespace

void RunExits(Run& run) {
  DevSts::Server sts;
  const ProbeFiles files(sts);
  const ProcessState before = ProcessState::Settled();
  while (run.HasTime()) {
    const Scenario& scenario = run.OneOf(kExits);
    const auto moment = run.TimeBelow(run.OneOf(std::vector{1000us, 20000us, 300000us}));
    run.Begin(std::string(scenario.name) + (scenario.isSilent ? ", silent STS" : "") + ", after " +
              std::to_string(moment.count()) + " us");
    DevSts::Misbehavior silent;
    silent.stall = scenario.isSilent ? DevSts::Stall::BeforeAnswer : DevSts::Stall::None;
    sts.SetMisbehavior(silent);
    RunProgram(run,
               {EXIT_PROBE, scenario.name, sts.HttpsUrl(), files.ca.Path(), files.signing.Path(),
                std::to_string(moment.count())},
               /*isLeakCheckOff=*/false);
  }
  RequireState(run, before, run.IsLong());
}

void RunForks(Run& run) {
  DevSts::Server sts;
  sts.RegisterCertificate(kMachine, Holder().certificatePem);
  const ProbeFiles files(sts);
  const Tarnik::Testing::TemporaryFile holder(Holder().certificatePem + Holder().privateKeyPem);
  const ProcessState before = ProcessState::Settled();
  while (run.HasTime()) {
    const std::string scenario = run.OneOf(kForks);
    const std::size_t forks = 1 + run.Below(run.IsLong() ? 50 : 5);
    run.Begin(scenario + ", " + std::to_string(forks) + " forks");
    RunProgram(run,
               {FORK_PROBE, scenario, sts.HttpsUrl(), files.ca.Path(), files.signing.Path(),
                holder.Path(), std::to_string(forks), std::to_string(kThreadsInCalls)},
               /*isLeakCheckOff=*/true);
  }
  RequireState(run, before, run.IsLong());
}

void RunPlugins(Run& run) {
  const ProcessState before = ProcessState::Settled();
  while (run.HasTime()) {
    const std::size_t cycles = 1 + run.Below(run.IsLong() ? 2000 : 100);
    run.Begin(std::to_string(cycles) + " cycles");
    // LeakSanitizer crashes when it looks for thread-local data of libraries that were loaded with
    // dlopen.
    RunProgram(run, {PLUGIN_HOST, PLUGIN, std::to_string(cycles), PLUGIN_LIBRARIES},
               /*isLeakCheckOff=*/true);
  }
  RequireState(run, before, false);
}

}  // namespace SsoClient::Testing
