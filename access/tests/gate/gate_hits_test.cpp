// Tokens that a gate remembers.
#include <algorithm>
#include <atomic>
#include <thread>
#include <vector>

#include "gate/gate_fixture.h"
#include "support/forked_child.h"

namespace SsoClient::Access::Testing {
namespace {

using std::chrono::hours;
using std::chrono::seconds;

class GateHitsTest : public GateFixture {
 protected:
  static Verdict CheckAt(const TokenGate& gate, const std::string& xml) {
    return gate.Check(xml, Presenter::Nobody());
  }
  // For what it does to the cache.
  static void Present(const TokenGate& gate, const std::string& xml) {
    static_cast<void>(CheckAt(gate, xml));
  }
  static Presenter Tls(const DevSts::Credential& credential) {
    return Presenter::WithTlsCertificate(CertificateOf(credential));
  }
  static void ExpectCounts(const TokenGate& gate, std::uint64_t hits, std::uint64_t misses,
                           std::size_t tokens) {
    const GateMetrics metrics = gate.Metrics();
    EXPECT_EQ(metrics.cacheHits, hits);
    EXPECT_EQ(metrics.cacheMisses, misses);
    EXPECT_EQ(metrics.cachedTokens, tokens);
    EXPECT_EQ(metrics.cachedBytes == 0, tokens == 0);
  }
  static std::string Times(std::size_t count, const std::string& piece) {
    std::string result;
    for (std::size_t i = 0; i < count; ++i) {
      result += piece;
    }
    return result;
  }
  std::string WithKeyValues(const std::string& values) const {
    return Replaced(token, "</ds:KeyInfo>", values + "</ds:KeyInfo>");
  }
  /// Expects that `larger` counts at least `bytes` bytes more than the token.
  void ExpectCountOfAdditions(const std::string& larger, std::size_t bytes) const {
    const auto gate = Make();
    ExpectAccepted(CheckAt(*gate, token));
    const std::size_t before = gate->Metrics().cachedBytes;
    ExpectAccepted(CheckAt(*gate, larger));
    EXPECT_GE(gate->Metrics().cachedBytes, 2 * before + bytes);
  }

  const std::string token = Signed(text);
};

// A presenter can add comments to any token. Each takes up to 64 bytes of memory.
TEST_F(GateHitsTest, CommentsCountAsMemory) {
  ExpectCountOfAdditions(token + Times(1000, "<!---->"), 1000 * 64);
}

// The content of KeyInfo is not signed. Elements without an end tag and texts between them take up
// to 135 bytes together, and attributes with three letters up to 44.
TEST_F(GateHitsTest, ElementsAndTextsInKeyInfoCountAsMemory) {
  ExpectCountOfAdditions(WithKeyValues("<ds:KeyValue>" + Times(1000, "<a/>b") + "</ds:KeyValue>"),
                         1000 * 135);
}

TEST_F(GateHitsTest, AttributesInKeyInfoCountAsMemory) {
  std::string values;
  for (char first = 'a'; first <= 'z'; ++first) {
    values += "<ds:KeyValue";
    for (char last = 'a'; last <= 'z'; ++last) {
      values.append({' ', first, 'x', last}).append("=''");
    }
    values += "/>";
  }
  ExpectCountOfAdditions(WithKeyValues(values), std::size_t{26} * 26 * 44);
}

TEST_F(GateHitsTest, Hit) {
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  ExpectCounts(*gate, 0, 1, 1);
  const Verdict hit = CheckAt(*gate, token);
  ExpectAccepted(hit);
  ExpectCounts(*gate, 1, 1, 1);
  EXPECT_EQ(gate->Metrics().accepted, 2U);
}

TEST_F(GateHitsTest, LedgerSaysWhenTheSignatureWasVerified) {
  const auto gate = Make();
  const std::string fresh = RecordOf(CheckAt(*gate, token), CheckKind::kSignature).compared;
  const std::string time = ", verified at " + now.ToString();
  now = After(now, seconds(1));
  EXPECT_EQ(RecordOf(CheckAt(*gate, token), CheckKind::kSignature).compared, fresh + time);
}

TEST_F(GateHitsTest, NoCache) {
  config.cache.tokens = 0;
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  ExpectAccepted(CheckAt(*gate, token));
  ExpectCounts(*gate, 0, 2, 0);
}

// As documented at `GateCacheConfig::bytes`.
TEST_F(GateHitsTest, MemoryIsCountedByTheLengthOfTheTextAndItsMarks) {
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  const auto count = [this](char mark) {
    return static_cast<std::size_t>(std::count(token.begin(), token.end(), mark));
  };
  std::size_t texts = 0;
  for (std::size_t i = 1; i < token.size(); ++i) {
    texts += token[i - 1] == '>' && token[i] != '<' ? 1 : 0;
  }
  EXPECT_EQ(gate->Metrics().cachedBytes,
            1024 + 3 * token.size() + 72 * count('<') + 56 * texts + 32 * count('='));
}

TEST_F(GateHitsTest, OneByteDiffers) {
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  for (std::size_t i = 0; i < token.size(); i += 97) {
    std::string flipped = token;
    flipped[i] = static_cast<char>(flipped[i] ^ 1);
    Present(*gate, flipped);
    EXPECT_EQ(gate->Metrics().cacheHits, 0U) << i;
  }
  ExpectRefused(CheckAt(*gate, Replaced(token, "alice@", "admin@")), Reason::kBadSignature,
                CheckKind::kSignature);
  ExpectAccepted(CheckAt(*gate, token));
  EXPECT_EQ(gate->Metrics().cacheHits, 1U);
}

TEST_F(GateHitsTest, ExpiredTokenIsForgotten) {
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  now = After(start, hours(2));
  ExpectRefused(CheckAt(*gate, token), Reason::kExpired, CheckKind::kValidity);
  ExpectCounts(*gate, 1, 1, 0);
}

TEST_F(GateHitsTest, PossessionIsProvedEachTime) {
  const std::string bound = Signed(HolderOfKeyText());
  const auto gate = Make();
  ExpectAccepted(gate->Check(bound, Tls(HolderCredential())));
  ExpectRefused(gate->Check(bound, Tls(OtherHolderCredential())), Reason::kWrongProof,
                CheckKind::kPossession);
  ExpectRefused(CheckAt(*gate, bound), Reason::kNoProof, CheckKind::kPossession);
  ExpectAccepted(gate->Check(bound, Tls(HolderCredential())));
  // Whoever cannot prove it does not make the gate forget the token.
  ExpectCounts(*gate, 3, 1, 1);
}

TEST_F(GateHitsTest, PredicateIsCalledEachTime) {
  int calls = 0;
  config.predicate = [&calls](const SamlToken&, std::string&) { return ++calls != 2; };
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  ExpectRefused(CheckAt(*gate, token), Reason::kRefusedByPredicate, CheckKind::kPredicate);
  ExpectAccepted(CheckAt(*gate, token));
  EXPECT_EQ(calls, 3);
  ExpectCounts(*gate, 2, 1, 1);
}

TEST_F(GateHitsTest, SignerExpires) {
  Signer signer = SignerOf(TrustedCredential());
  signer.notAfter = After(start, seconds(600));
  Trust(signer);
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  now = After(start, seconds(901));
  ExpectRefused(CheckAt(*gate, token), Reason::kSignerExpired, CheckKind::kSignerValid);
  ExpectCounts(*gate, 0, 2, 0);
}

// As if the token had not been remembered.
TEST_F(GateHitsTest, AnotherCertificateOfTheSignersKeyIsValidStill) {
  DevSts::CertificateSpec spec;
  spec.commonName = "renewed";
  const DevSts::Credential first = DevSts::MakeCertificate(spec);
  const DevSts::Credential second = DevSts::MakeCertificate(spec);
  Signer old = SignerOf(first);
  old.notAfter = After(start, seconds(600));
  trust->Set({{kTokenIssuer, {old, SignerOf(second)}}});
  DevSts::SignOptions options;
  options.keyInfo = DevSts::KeyInfoContent::None;
  const std::string xml = text.ToSignedXml(first, options);
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, xml));
  now = After(start, seconds(901));
  ExpectAccepted(CheckAt(*gate, xml));
  ExpectCounts(*gate, 0, 2, 1);
}

TEST_F(GateHitsTest, RevocationListExpires) {
  Signer signer = SignerOf(TrustedCredential());
  signer.isRevocationChecked = true;
  signer.listFrom = After(start, hours(-1));
  signer.listUntil = After(start, seconds(600));
  Trust(signer);
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  now = After(start, seconds(900));
  ExpectRefused(CheckAt(*gate, token), Reason::kRevocationUnknown, CheckKind::kSignerRevoked);
}

TEST_F(GateHitsTest, SignerIsRevoked) {
  Signer signer = SignerOf(TrustedCredential());
  signer.isRevocationChecked = true;
  signer.listFrom = After(start, hours(-1));
  signer.listUntil = After(start, hours(1));
  Trust(signer);
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  signer.revokedSince = start;
  Trust(signer);
  ExpectRefused(CheckAt(*gate, token), Reason::kSignerRevoked, CheckKind::kSignerRevoked);
  ExpectCounts(*gate, 0, 2, 0);
}

TEST_F(GateHitsTest, TrustIsTakenAway) {
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  trust->Set({});
  ExpectRefused(CheckAt(*gate, token), Reason::kUnknownIssuer, CheckKind::kSignerKnown);
  ExpectCounts(*gate, 0, 2, 0);
  Trust(SignerOf(TrustedCredential()));
  ExpectAccepted(CheckAt(*gate, token));
  ExpectCounts(*gate, 0, 3, 1);
}

// Trust that is gone is not kept in memory by tokens that nobody presents.
TEST_F(GateHitsTest, OldTrustIsReleased) {
  config.cache.tokens = 10;
  const auto gate = Make();
  ExpectAccepted(CheckAt(*gate, token));
  const std::weak_ptr<const TrustSnapshot> old = trust->Current();
  Trust(SignerOf(TrustedCredential()));
  AssertionText other = text;
  other.attributes = Replaced(other.attributes, "_a1", "_a2");
  ExpectAccepted(CheckAt(*gate, Signed(other)));
  EXPECT_TRUE(old.expired());
}

TEST_F(GateHitsTest, NothingOfARefusedTokenIsKept) {
  bool isWelcome = false;
  config.predicate = [&isWelcome](const SamlToken&, std::string&) { return isWelcome; };
  const auto gate = Make();
  ExpectRefused(CheckAt(*gate, token), Reason::kRefusedByPredicate, CheckKind::kPredicate);
  ExpectCounts(*gate, 0, 1, 0);
  isWelcome = true;
  std::weak_ptr<const SamlToken> kept = CheckAt(*gate, token).Token();
  EXPECT_FALSE(kept.expired());
  ExpectCounts(*gate, 0, 2, 1);
}

TEST_F(GateHitsTest, TwoGatesShareNothing) {
  const auto first = Make();
  config.audiences = {"https://c.example"};
  const auto second = Make();
  ExpectAccepted(CheckAt(*first, token));
  ExpectRefused(CheckAt(*second, token), Reason::kWrongAudience, CheckKind::kAudience);
  ExpectCounts(*second, 0, 1, 0);
  ExpectAccepted(CheckAt(*first, token));
}

TEST_F(GateHitsTest, VerdictsOutliveTheirGate) {
  auto gate = Make();
  Present(*gate, token);
  const Verdict hit = CheckAt(*gate, token);
  const Verdict refused = CheckAt(*gate, "<");
  gate.reset();
  config = {};
  trust->Set({});
  ExpectAccepted(hit);
  ExpectRefused(refused, Reason::kNotWellFormed, CheckKind::kWellFormed);
}

TEST_F(GateHitsTest, Refusals) {
  const auto gate = Make();
  Present(*gate, "<");
  Present(*gate, "<a/>");
  Present(*gate, "<b/>");
  const GateMetrics metrics = gate->Metrics();
  EXPECT_EQ(metrics.accepted, 0U);
  ASSERT_EQ(metrics.refused.size(), static_cast<std::size_t>(Reason::kPredicateFailed) + 1);
  EXPECT_EQ(metrics.refused[0], 0U);
  EXPECT_EQ(metrics.refused[static_cast<std::size_t>(Reason::kNotWellFormed)], 1U);
  EXPECT_EQ(metrics.refused[static_cast<std::size_t>(Reason::kBadLayout)], 2U);
}

TEST_F(GateHitsTest, LeastRecentlyPresentedIsEvicted) {
  config.cache.tokens = 2;
  const auto gate = Make();
  std::vector<std::string> tokens;
  for (const char* id : {"_a1", "_a2", "_a3"}) {
    AssertionText other = text;
    other.attributes = Replaced(other.attributes, "_a1", id);
    tokens.push_back(Signed(other));
  }
  Present(*gate, tokens[0]);
  Present(*gate, tokens[1]);
  Present(*gate, tokens[0]);
  Present(*gate, tokens[2]);
  ExpectCounts(*gate, 1, 3, 2);
  EXPECT_EQ(gate->Metrics().evictions, 1U);
  Present(*gate, tokens[0]);
  ExpectCounts(*gate, 2, 3, 2);
  Present(*gate, tokens[1]);
  ExpectCounts(*gate, 2, 4, 2);
}

TEST_F(GateHitsTest, ForkedChildBeginsWithoutTokens) {
  const auto gate = Make();
  Present(*gate, token);
  EXPECT_TRUE(Tarnik::Testing::HoldsInChild([&] {
    const bool isEmpty = gate->Metrics().cachedTokens == 0 && gate->Metrics().accepted == 0;
    const bool isAccepted = CheckAt(*gate, token).IsAccepted();
    return isEmpty && isAccepted && gate->Metrics().cacheMisses == 1;
  }));
  ExpectCounts(*gate, 0, 1, 1);
}

TEST_F(GateHitsTest, ConcurrentChecks) {
  config.cache.tokens = 3;
  const auto gate = Make();
  std::vector<std::string> tokens;
  for (int i = 0; i < 6; ++i) {
    AssertionText other = text;
    other.attributes = Replaced(other.attributes, "_a1", "_a" + std::to_string(i));
    tokens.push_back(Signed(other));
  }
  constexpr int kThreads = 4;
  constexpr int kRounds = 8;
  std::atomic<int> refused{0};
  std::vector<std::thread> threads;
  for (int thread = 0; thread < kThreads; ++thread) {
    threads.emplace_back([&, thread] {
      for (int i = 0; i < kRounds; ++i) {
        for (std::size_t k = 0; k < tokens.size(); ++k) {
          const Verdict verdict = CheckAt(*gate, tokens[(k * (1 + thread % 2)) % tokens.size()]);
          refused += verdict.IsAccepted() ? 0 : 1;
        }
        gate->Metrics();
      }
    });
  }
  for (int i = 0; i < 20; ++i) {
    Trust(SignerOf(TrustedCredential()));
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(refused, 0);
  const GateMetrics metrics = gate->Metrics();
  EXPECT_EQ(metrics.accepted, kThreads * kRounds * tokens.size());
  EXPECT_EQ(metrics.cacheHits + metrics.cacheMisses, metrics.accepted);
  EXPECT_LE(metrics.cachedTokens, 3U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
