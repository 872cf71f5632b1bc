// Threads that check tokens while the trust changes: each verdict is one of a complete trust, and
// a check that begins after a change has that trust.
#include <array>
#include <atomic>
#include <chrono>
#include <filesystem>
#include <thread>
#include <vector>

#include <ssoclient/access/trust_store.h>

#include "gate_attacks/attack_fixture.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace SsoClient::Access::Testing {
namespace {

using Tarnik::Testing::Identity;
using Tarnik::Testing::MakeCrl;

constexpr std::size_t kStates = 5;
constexpr int kThreads = 4;
constexpr int kChanges = 40;

/// A complete trust, and what a gate says with it about the tokens of the two signers and about one
/// that nobody has signed.
struct State {
  bool hasFirst;
  bool hasSecond;
  bool isFirstRevoked;
  std::array<Reason, 3> reasons;
  long listUntil = 3600;  ///< seconds from now
};

constexpr std::array<State, kStates> kAllStates{
    {{true, false, false, {Reason::kNone, Reason::kUnknownSigner, Reason::kBadSignature}},
     {true, true, false, {Reason::kNone, Reason::kNone, Reason::kBadSignature}},
     {false, true, false, {Reason::kUnknownSigner, Reason::kNone, Reason::kUnknownSigner}},
     {true, true, true, {Reason::kSignerRevoked, Reason::kNone, Reason::kSignerRevoked}},
     {true,
      true,
      false,
      {Reason::kRevocationUnknown, Reason::kRevocationUnknown, Reason::kRevocationUnknown},
      -600}}};

class TrustChangesThreadTest : public AttackFixture {
 protected:
  TrustChangesThreadTest() {
    std::filesystem::create_directory(root.Path() + "/trust");
    Write(kAllStates[0]);
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
    Replace("list.crl",
            MakeCrl(authority, state.isFirstRevoked ? &first : nullptr, state.listUntil, -7200));
  }
  void Replace(const std::string& name, const std::string& content) const {
    std::filesystem::rename(root.Write("new", content), root.Path() + "/" + name);
  }
  std::string SignedBy(const Identity& signer) const {
    return text.ToSignedXml({signer.Pem(), signer.KeyPem()});
  }

  /// Damages the files, in a way for each number, while the trust stays as it was.
  void Damage(int number) {
    const int way = (number + number / 5) % 5;
    const std::string folder = root.Path() + "/trust";
    const std::string file = folder + "/signers.pem";
    switch (way) {
      case 0:  // half written
        Replace("trust/more.pem", second.Pem().substr(0, 200));
        break;
      case 1:  // a certificate that is whole, and one that is not
        Replace("trust/more.pem", second.Pem() + first.Pem().substr(0, 300));
        break;
      case 2:
        std::filesystem::rename(folder, root.Path() + "/elsewhere");
        break;
      case 3:  // unreadable
        std::filesystem::create_symlink("nowhere", folder + "/more.pem");
        break;
      default:  // a list by a stranger
        Replace("list.crl", MakeCrl(stranger, &second));
    }
    EXPECT_THROW(config.trust->Reload(), Tarnik::Exception) << way;
    AwaitChecks();
    if (way == 2) {
      std::filesystem::rename(root.Path() + "/elsewhere", folder);
    }
    std::filesystem::remove(folder + "/more.pem");
  }
  /// Returns after as many further checks as there are threads.
  void AwaitChecks() const {
    const int enough = checks_ + kThreads;
    while (checks_ < enough) {
      std::this_thread::yield();
    }
  }

  // Even between changes, when the state is that of `phase_ / 2`; odd during a change.
  template <class Adopt>
  void ChangeAll(int changes, const Adopt& adopt) {
    for (int change = 1; change <= changes; ++change) {
      const State& state = kAllStates[static_cast<std::size_t>(change) % kStates];
      ++phase_;
      Write(state);
      adopt(state);
      ++phase_;
      AwaitChecks();
      Damage(change);
    }
    isDone_ = true;
  }
  template <class Adopt>
  void CheckWhileChanging(int changes, const Adopt& adopt) {
    const auto gate = Make();
    std::vector<std::thread> threads;
    for (int i = 0; i < kThreads; ++i) {
      threads.emplace_back([&] { CheckUntilDone(*gate); });
    }
    ChangeAll(changes, [&](const State& state) { adopt(*gate, state); });
    for (std::thread& thread : threads) {
      thread.join();
    }
    EXPECT_EQ(impossible_, 0);
    EXPECT_EQ(incomplete_, 0);
    EXPECT_GT(accepted_, 0);
    EXPECT_LT(accepted_, checks_);
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
  TrustStoreConfig store;
  const Identity stranger = Tarnik::Testing::MakeCa("Authority");
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
  CheckWhileChanging(kChanges, [this](const TokenGate&, const State&) { config.trust->Reload(); });
}

TEST_F(TrustChangesThreadTest, EachVerdictOfAWatchedTrustIsOneOfACompleteTrust) {
  store.isWatching = true;
  config.trust = CreateTrustStore(store);
  const auto hasReasons = [this](const TokenGate& gate, const State& state) {
    for (std::size_t token = 0; token < tokens.size(); ++token) {
      if (gate.Check(tokens.at(token), Presenter::Nobody()).Refusal() != state.reasons.at(token)) {
        return false;
      }
    }
    return true;
  };
  CheckWhileChanging(kStates, [&](const TokenGate& gate, const State& state) {
    const auto limit = std::chrono::steady_clock::now() + std::chrono::seconds(30);
    while (!hasReasons(gate, state) && std::chrono::steady_clock::now() < limit) {
      std::this_thread::sleep_for(std::chrono::milliseconds(10));
    }
    EXPECT_TRUE(hasReasons(gate, state));
  });
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
