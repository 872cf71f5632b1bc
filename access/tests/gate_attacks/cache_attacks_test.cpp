// Presentations that try to fill the memory of a gate, or to keep it busy.
#include <algorithm>
#include <ctime>
#include <functional>

#include "gate_attacks/attack_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

class CacheAttacksTest : public AttackFixture {
 protected:
  Verdict Present(const std::string& token) const {
    return gate->Check(token, Presenter::Nobody());
  }

  const std::string original = Signed(text);
  std::shared_ptr<TokenGate> gate = Make();
};

// A comment after the assertion changes neither its signature nor its values.
TEST_F(CacheAttacksTest, ManyTextsOfOneTokenAreEvictedInTurn) {
  constexpr std::size_t kTokens = 32;
  constexpr std::size_t kTexts = 400;
  config.cache.tokens = kTokens;
  gate = Make();
  ASSERT_TRUE(Present(original).IsAccepted());
  for (std::size_t i = 0; i < kTexts; ++i) {
    ASSERT_TRUE(Present(original + "<!--" + std::to_string(i) + "-->").IsAccepted());
    ASSERT_LE(gate->Metrics().cachedTokens, kTokens);
    ASSERT_LE(gate->Metrics().cachedBytes, config.cache.bytes);
  }
  EXPECT_EQ(gate->Metrics().evictions, kTexts + 1 - kTokens);
  EXPECT_EQ(gate->Metrics().cacheHits, 0U);
  const std::string last = original + "<!--" + std::to_string(kTexts - 1) + "-->";
  ExpectAccepted(Present(last));
  EXPECT_EQ(gate->Metrics().cacheHits, 1U);
  ExpectAccepted(Present(original));
  EXPECT_EQ(gate->Metrics().cacheHits, 1U);
}

TEST_F(CacheAttacksTest, LargeTextsOfOneTokenKeepTheLimitOfBytes) {
  config.cache.bytes = std::size_t{4} * 1024 * 1024;
  gate = Make();
  const std::string padding(100'000, ' ');
  for (int i = 0; i < 40; ++i) {
    ASSERT_TRUE(Present(original + padding + "<!--" + std::to_string(i) + "-->").IsAccepted());
    ASSERT_LE(gate->Metrics().cachedBytes, config.cache.bytes);
  }
  EXPECT_GT(gate->Metrics().evictions, 0U);
  EXPECT_GT(gate->Metrics().cachedTokens, 0U);
}

TEST_F(CacheAttacksTest, RefusedTokensFillNothing) {
  config.cache.tokens = 1;
  gate = Make();
  ASSERT_TRUE(Present(original).IsAccepted());
  AssertionText stranger = text;
  const std::string strangers = stranger.ToSignedXml(StrangerCredential());
  const std::string otherAudience = Replaced(original, kAudience, "https://c.example");
  for (const std::string& refused :
       {std::string(), std::string("<a/>"), original + "<", strangers, otherAudience,
        Replaced(original, "alice@", "admin@"), std::string(300'000, ' ')}) {
    for (int i = 0; i < 10; ++i) {
      ASSERT_FALSE(Present(refused).IsAccepted());
    }
    EXPECT_EQ(gate->Metrics().cachedTokens, 1U);
    EXPECT_EQ(gate->Metrics().evictions, 0U);
  }
  ASSERT_TRUE(Present(original).IsAccepted());
  EXPECT_EQ(gate->Metrics().cacheHits, 1U);
}

TEST_F(CacheAttacksTest, TheLargestTokenIsReadAndALargerOneIsNot) {
  const std::size_t largest = config.largestToken;
  ASSERT_EQ(largest, 256U * 1024U);
  const auto sized = [this](std::size_t size) {
    return original + std::string(size - original.size(), ' ');
  };
  ExpectAccepted(Present(sized(largest)));
  ExpectRefused(Present(sized(largest + 1)), Reason::kTooLarge, CheckKind::kSize);
  const GateMetrics metrics = gate->Metrics();
  EXPECT_EQ(metrics.cacheMisses, 1U);
  ExpectRefused(Present(std::string(std::size_t{64} * 1024 * 1024, '<')), Reason::kTooLarge,
                CheckKind::kSize);
  EXPECT_EQ(gate->Metrics().cacheMisses, metrics.cacheMisses);
}

double SecondsOf(const std::function<void()>& action) {
  double best = 1e9;
  for (int attempt = 0; attempt < 5; ++attempt) {
    const std::clock_t begin = std::clock();
    action();
    best = std::min(best, static_cast<double>(std::clock() - begin) / CLOCKS_PER_SEC);
  }
  return best;
}

std::string Times(std::size_t count, const std::string& piece) {
  std::string result;
  for (std::size_t i = 0; i < count; ++i) {
    result += piece;
  }
  return result;
}

/// A text that is refused late, with `count` times a piece.
struct LateRefusal {
  const char* name;
  std::string (*make)(const AssertionText& text, std::size_t count);
  std::size_t count;
};

std::string Tampered(const AssertionText& text) {
  return Replaced(text.ToSignedXml(TrustedCredential()), "alice@", "admin@");
}

std::string ManyAudiences(const AssertionText& text, std::size_t count) {
  AssertionText changed = text;
  changed.conditions =
      InsertedAfter(changed.conditions, "<saml2:AudienceRestriction>",
                    Times(count, "<saml2:Audience>https://c.example</saml2:Audience>"));
  return Tampered(changed);
}

std::string ManyDelegates(const AssertionText& text, std::size_t count) {
  AssertionText changed = AssertionText(text).Delegate();
  changed.conditions = InsertedAfter(
      changed.conditions, R"(<saml2:Condition xsi:type="del:DelegationRestrictionType">)",
      Times(count,
            R"(<del:Delegate DelegationInstant="2024-03-05T07:08:09Z"><saml2:NameID )"
            R"(Format="http://schemas.xmlsoap.org/claims/UPN">d@e</saml2:NameID></del:Delegate>)"));
  return changed.ToSignedXml(TrustedCredential());
}

std::string ManyKeyHints(const AssertionText& text, std::size_t count) {
  return Replaced(text.ToSignedXml(StrangerCredential()), "</ds:X509Data>",
                  Times(count, "<ds:X509Certificate>AAAA</ds:X509Certificate>") + "</ds:X509Data>");
}

std::string Unfinished(const AssertionText& text, std::size_t count) {
  return text.ToXml() + Times(count, "<!-- a comment -->\n") + "<";
}

std::string LongIssuer(const AssertionText& text, std::size_t count) {
  AssertionText changed = text;
  changed.issuer = Replaced(changed.issuer, kTokenIssuer, Times(count, "&#13;&#10;&quot;name"));
  return changed.ToSignedXml(TrustedCredential());
}

class LateRefusalTest : public CacheAttacksTest,
                        public ::testing::WithParamInterface<LateRefusal> {};

// Each doubling may take 2.5 times as long; a quadratic step takes four times as long. The texts of
// the ledger are made, too.
TEST_P(LateRefusalTest, TakesATimeThatIsLinearInTheSize) {
  config.largestToken = std::size_t{8} * 1024 * 1024;
  gate = Make();
  const auto secondsOf = [this](std::size_t factor) {
    const std::string token = GetParam().make(text, GetParam().count * factor);
    EXPECT_FALSE(Present(token).IsAccepted());
    return SecondsOf([&] { Present(token).Ledger(); });
  };
  const double small = secondsOf(1);
  EXPECT_LT(secondsOf(4), 2.5 * 2.5 * std::max(small, 1e-3));
}

INSTANTIATE_TEST_SUITE_P(Shapes, LateRefusalTest,
                         ::testing::Values(LateRefusal{"ManyAudiences", ManyAudiences, 1500},
                                           LateRefusal{"ManyDelegates", ManyDelegates, 500},
                                           LateRefusal{"ManyKeyHints", ManyKeyHints, 1500},
                                           LateRefusal{"Unfinished", Unfinished, 4000},
                                           LateRefusal{"LongIssuer", LongIssuer, 3000}),
                         [](const auto& tested) { return std::string(tested.param.name); });

}  // namespace
}  // namespace SsoClient::Access::Testing
