#include "cache_key.h"

#include <cstdint>
#include <cstring>
#include <functional>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include "support/issued_token.h"

namespace SsoClient::Access {

namespace {

TokenSpec Full() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  spec.audienceRestriction = {"https://a", "https://b"};
  spec.advice = {{"source", {{"name", {"one", "two"}}, {"empty", {}}}}};
  spec.delegateTo = std::string("carol");
  spec.actAsToken =
      std::shared_ptr<const SamlToken>(std::make_shared<Testing::IssuedToken>("_1", 0, 1));
  return spec;
}

TEST(CacheKeyTest, CopiesAreEqual) {
  const TokenSpec spec = Full();
  const TokenSpec copy = spec;
  EXPECT_TRUE(AreEqual(spec, copy));
  EXPECT_EQ(HashOf(spec), HashOf(copy));
  EXPECT_EQ(MakeKey(spec)->hash, HashOf(spec));
}

TEST(CacheKeyTest, EveryFieldCounts) {
  const std::vector<std::function<void(TokenSpec&)>> changes = {
      [](TokenSpec& spec) { spec.tokenLifetimeSec = 3601; },
      [](TokenSpec& spec) { spec.audienceRestriction.insert("https://c"); },
      [](TokenSpec& spec) { spec.audienceRestriction = {"https://a"}; },
      [](TokenSpec& spec) { spec.advice.clear(); },
      [](TokenSpec& spec) { spec.advice[0].source = "other"; },
      [](TokenSpec& spec) { spec.advice[0].attributes[0].name = "other"; },
      [](TokenSpec& spec) {
        spec.advice[0].attributes[0].values = {"two", "one"};
      },
      [](TokenSpec& spec) { spec.advice[0].attributes.pop_back(); },
      [](TokenSpec& spec) { spec.advice.push_back(spec.advice[0]); },
      [](TokenSpec& spec) { spec.delegable = true; },
      [](TokenSpec& spec) { spec.delegateTo = boost::none; },
      [](TokenSpec& spec) { spec.delegateTo = std::string("dave"); },
      [](TokenSpec& spec) { spec.actAsToken = boost::none; },
      [](TokenSpec& spec) {
        spec.actAsToken =
            std::shared_ptr<const SamlToken>(std::make_shared<Testing::IssuedToken>("_2", 0, 1));
      },
      [](TokenSpec& spec) { spec.renewable = true; },
      [](TokenSpec& spec) { spec.confirmation = CONFIRMATION_BEARER; },
  };
  const TokenSpec spec = Full();
  for (std::size_t i = 0; i < changes.size(); ++i) {
    TokenSpec changed = spec;
    changes[i](changed);
    EXPECT_FALSE(AreEqual(spec, changed)) << i;
    EXPECT_FALSE(AreEqual(changed, spec)) << i;
    EXPECT_NE(HashOf(spec), HashOf(changed)) << i;
  }
}

TEST(CacheKeyTest, ActAsTokensWithTheSameTextAreEqual) {
  const TokenSpec spec = Full();
  TokenSpec same = spec;
  same.actAsToken =
      std::shared_ptr<const SamlToken>(std::make_shared<Testing::IssuedToken>("_1", 0, 1));
  EXPECT_TRUE(AreEqual(spec, same));
  EXPECT_EQ(HashOf(spec), HashOf(same));
}

TEST(CacheKeyTest, AllValuesForBearerAreEqual) {
  TokenSpec bearer = Full();
  bearer.confirmation = CONFIRMATION_BEARER;
  TokenSpec other = bearer;
  other.confirmation = static_cast<ConfirmationType>(7);
  EXPECT_TRUE(AreEqual(bearer, other));
  EXPECT_EQ(HashOf(bearer), HashOf(other));
}

// Two texts of 16 bytes with one hash by the standard library, which has no key: the second word is
// chosen so that it undoes the difference of the first (MurmurHash64A).
std::pair<std::string, std::string> TextsWithOneStandardHash() {
  constexpr std::uint64_t kFactor = 0xc6a4a7935bd1e995U;
  std::uint64_t inverse = 1;
  for (int i = 0; i < 6; ++i) {
    inverse *= 2 - kFactor * inverse;
  }
  const auto fold = [](std::uint64_t value) { return value ^ (value >> 47); };
  const auto mixed = [&](std::uint64_t word) { return fold(word * kFactor) * kFactor; };
  const auto text = [](std::uint64_t first, std::uint64_t second) {
    std::string bytes(16, '\0');
    std::memcpy(bytes.data(), &first, 8);
    std::memcpy(bytes.data() + 8, &second, 8);
    return bytes;
  };
  const std::uint64_t begun = 0xc70f6907U ^ (16 * kFactor);
  const std::uint64_t one = (begun ^ mixed(1)) * kFactor;
  const std::uint64_t other = (begun ^ mixed(2)) * kFactor;
  const std::uint64_t undone = fold((one ^ other ^ mixed(3)) * inverse) * inverse;
  return {text(1, 3), text(2, undone)};
}

TEST(CacheKeyTest, TextsCannotBeChosenForTheirHash) {
  const auto [one, other] = TextsWithOneStandardHash();
  if (std::hash<std::string>()(one) != std::hash<std::string>()(other)) {
    GTEST_SKIP() << "another standard library";
  }
  TokenSpec first;
  first.audienceRestriction = {one};
  TokenSpec second;
  second.audienceRestriction = {other};
  EXPECT_NE(HashOf(first), HashOf(second));
  EXPECT_EQ(HashOf(first), HashOf(first));
}

TEST(CacheKeyTest, ViewsAreEqualToTheirKeys) {
  const TokenSpec spec = Full();
  const KeyPtr key = MakeKey(spec);
  TokenSpec changed = spec;
  changed.delegable = true;
  EXPECT_TRUE(KeyEqual()(SpecView(spec), key));
  EXPECT_TRUE(KeyEqual()(key, MakeKey(spec)));
  EXPECT_FALSE(KeyEqual()(key, SpecView(changed)));
  EXPECT_EQ(KeyHash()(SpecView(spec)), KeyHash()(key));
}

}  // namespace

}  // namespace SsoClient::Access
