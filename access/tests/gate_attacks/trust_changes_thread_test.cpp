// Threads that check tokens while the trust changes: each verdict is one of a complete trust, and
// a check that begins after a change has that trust.
#include <array>
#include <atomic>
#include <filesystem>
#include <thread>

#include <ssoclient/access/trust_store.h>

#include "gate_attacks/attack_fixture.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace SsoClient::Access::Testing {
namespace {

using Tarnik::Testing::Identity;
using Tarnik::Testing::MakeCrl;

constexpr std::size_t kStates = 4;
constexpr int kThreads = 4;
constexpr int kChanges = 40;

/// A complete trust, and what a gate says with it about the tokens of the two signers and about one
/// that nobody has signed.
struct State {
  bool hasFirst;
  bool hasSecond;
  bool isFirstRevoked;
  std::array<Reason, 3> reasons;
};

constexpr std::array<State, kStates> kAllStates{
    {{true, false, false, {Reason::kNone, Reason::kUnknownSigner, Reason::kBadSignature}},
     {true, true, false, {Reason::kNone, Reason::kNone, Reason::kBadSignature}},
     {false, true, false, {Reason::kUnknownSigner, Reason::kNone, Reason::kUnknownSigner}},
     {true, true, true, {Reason::kSignerRevoked, Reason::kNone, Reason::kSignerRevoked}}}};

class TrustChangesThreadTest : public AttackFixture {
 protected:
  TrustChangesThreadTest() {
    std::filesystem::create_directory(root.Path() + "/trust");
    Write(kAllStates[0]);
    TrustStoreConfig store;
    store.issuers.resize(1);
    store.issuers[0].issuer = kTokenIssuer;
    store.issuers[0].certificatePaths = {root.Path() + "/trust"};
    store.issuers[0].revocationListPaths = {root.Path() + "/list.crl"};
    store.issuers[0].listSignerPaths = {root.Write("authority.pem", authority.Pem())};
    store.isWatching = false;
    config.trust = CreateTrustStore(store);
    config.clock = nullptr;
    config.cache.tokens = 2;  // so that tokens are evicted, too
  }

  void Write(const State& state) const {
    Replace("trust/signers.pem", (state.hasFirst ? first.Pem() : std::string()) +
                                     (state.hasSecond ? second.Pem() : std::string()));
    Replace("list.crl", MakeCrl(authority, state.isFirstRevoked ? &first : nullptr));
  }
  void Replace(const std::string& name, const std::string& content) const {
    std::filesystem::rename(root.Write("new", content), root.Path() + "/" + name);
  }
  std::string SignedBy(const Identity& signer) const {
    return text.ToSignedXml({signer.Pem(), signer.KeyPem()});
  }

  // Even between changes, when the state is that of `phase_ / 2`; odd during a change.
  void ChangeAll() {
    for (int change = 1; change <= kChanges; ++change) {
      ++phase_;
      Write(kAllStates[static_cast<std::size_t>(change) % kStates]);
      config.trust->Reload();
      ++phase_;
      while (checks_.load() < change * kThreads) {
        std::this_thread::yield();
      }
    }
    isDone_ = true;
  }

  static bool IsPossible(Reason reason, std::size_t token, int before, int after) {
    const int last = (after + 1) / 2;
    for (int state = before / 2; state <= last; ++state) {
      if (kAllStates[static_cast<std::size_t>(state) % kStates].reasons.at(token) == reason) {
        return true;
      }
    }
    return false;
  }

  void CheckUntilDone(const TokenGate& gate) {
    for (std::size_t i = 0; !isDone_; ++i) {
      const std::size_t token = i % tokens.size();
      const int before = phase_;
      const Verdict verdict = gate.Check(tokens.at(token), Presenter::Nobody());
      const int after = phase_;
      const bool isPossible = IsPossible(verdict.Refusal(), token, before, after);
      impossible_ += isPossible ? 0 : 1;
      accepted_ += verdict.IsAccepted() ? 1 : 0;
      // Texts are made from the trust of the check, which may have been replaced since.
      incomplete_ += verdict.Ledger().size() == 15 ? 0 : 1;
      ++checks_;
    }
  }

  const Tarnik::Testing::TemporaryFolder root;
  const Identity authority = Tarnik::Testing::MakeCa("Authority");
  const Identity first = Tarnik::Testing::MakeIdentity({.commonName = "first"}, &authority);
  const Identity second = Tarnik::Testing::MakeIdentity({.commonName = "second"}, &authority);
  const std::array<std::string, 3> tokens{SignedBy(first), SignedBy(second),
                                          Replaced(SignedBy(first), "alice@", "admin@")};

  std::atomic<int> phase_{0};
  std::atomic<int> checks_{0};
  std::atomic<int> accepted_{0};
  std::atomic<int> impossible_{0};
  std::atomic<int> incomplete_{0};
  std::atomic<bool> isDone_{false};
};

TEST_F(TrustChangesThreadTest, EachVerdictIsOneOfACompleteTrust) {
  const auto gate = Make();
  std::vector<std::thread> threads;
  for (int i = 0; i < kThreads; ++i) {
    threads.emplace_back([&] { CheckUntilDone(*gate); });
  }
  ChangeAll();
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(impossible_, 0);
  EXPECT_EQ(incomplete_, 0);
  EXPECT_GT(accepted_, 0);
  EXPECT_LT(accepted_, checks_);
}

TEST_F(TrustChangesThreadTest, EachStateHasItsReasons) {
  const auto gate = Make();
  for (const State& state : kAllStates) {
    Write(state);
    config.trust->Reload();
    for (std::size_t token = 0; token < tokens.size(); ++token) {
      for (int presentation = 0; presentation < 2; ++presentation) {
        EXPECT_EQ(gate->Check(tokens.at(token), Presenter::Nobody()).Refusal(),
                  state.reasons.at(token))
            << token;
      }
    }
  }
}

}  // namespace
}  // namespace SsoClient::Access::Testing
