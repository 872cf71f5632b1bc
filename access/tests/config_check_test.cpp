#include "config_check.h"

#include <functional>
#include <limits>

#include <gtest/gtest.h>

#include "support/issued_token.h"
#include "support/virtual_runtime.h"
#include "token_source_impl.h"

namespace SsoClient::Access {

namespace {

TokenSourceConfig Good() {
  TokenSourceConfig config;
  config.endpoints = {{"https://sts.example.com", ""}};
  config.tokenFactory = CreateSamlTokenFactory(nullptr);
  config.login = PasswordLogin{"alice", [] { return std::string("secret"); }};
  return config;
}

HolderOfKeyConfig Key() {
  return {Tarnik::MakeRef<Testing::NamedCertificate>("own"), nullptr};
}

TokenSpec SpecFor(const std::string& audience) {
  TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  spec.audienceRestriction = {audience};
  return spec;
}

struct BadConfig {
  const char* message;
  std::function<void(TokenSourceConfig&)> spoil;
};

std::vector<BadConfig> BadLogins() {
  return {
      {"There is no endpoint.", [](auto& config) { config.endpoints.clear(); }},
      {"The token factory is null.", [](auto& config) { config.tokenFactory = nullptr; }},
      {"The function for the password is not set.",
       [](auto& config) {
         config.login = PasswordLogin{"alice", nullptr};
       }},
      {"The login by certificate needs a holder-of-key configuration.",
       [](auto& config) { config.login = CertificateLogin{}; }},
      {"The function for negotiation handlers is not set.",
       [](auto& config) { config.login = NegotiatedLogin{}; }},
      {"The source of the token to exchange is null.",
       [](auto& config) { config.login = TokenLogin{}; }},
      {"Some endpoints are https URLs and others http URLs: a failure of TLS would send the login "
       "in "
       "plain text.",
       [](auto& config) {
         config.endpoints.push_back({"http://sts.example.com", ""});
       }},
  };
}

std::vector<BadConfig> BadRefreshes() {
  constexpr double kNaN = std::numeric_limits<double>::quiet_NaN();
  const char* fraction =
      "The fraction of the lifetime after which tokens are refreshed is not between 0 and 1.";
  const char* jitter = "The jitter of refreshes is not between 0 and 1.";
  return {
      {fraction, [](auto& config) { config.refresh.fraction = 0; }},
      {fraction, [](auto& config) { config.refresh.fraction = 1; }},
      {fraction, [](auto& config) { config.refresh.fraction = -0.5; }},
      {fraction, [](auto& config) { config.refresh.fraction = kNaN; }},
      {jitter, [](auto& config) { config.refresh.jitter = -0.1; }},
      {jitter, [](auto& config) { config.refresh.jitter = 1.1; }},
      {jitter, [](auto& config) { config.refresh.jitter = kNaN; }},
      {"The longest margin of a token is negative.",
       [](auto& config) { config.refresh.longestMargin = std::chrono::seconds(-1); }},
  };
}

std::vector<BadConfig> BadRetries() {
  using std::chrono::milliseconds;
  using std::chrono::seconds;
  const char* limit = "The limit of an attempt is not between 1 ms and 240 s.";
  const char* delay = "A delay between attempts is not positive.";
  return {
      {"The number of attempts is not positive.", [](auto& config) { config.retry.attempts = 0; }},
      {"The number of attempts at once is not positive.",
       [](auto& config) { config.retry.attemptsAtOnce = 0; }},
      {limit, [](auto& config) { config.retry.attemptTimeout = milliseconds(0); }},
      {limit, [](auto& config) { config.retry.attemptTimeout = seconds(241); }},
      {delay, [](auto& config) { config.retry.firstDelay = milliseconds(0); }},
      {delay, [](auto& config) { config.retry.longestDelay = milliseconds(0); }},
      {"The longest Retry-After is negative.",
       [](auto& config) { config.retry.longestRetryAfter = milliseconds(-1); }},
      {"The number of failures after which an endpoint is left out is not positive.",
       [](auto& config) { config.retry.failuresToOpen = 0; }},
      {"The time for which a refused login is remembered is negative.",
       [](auto& config) { config.retry.refusalMemory = seconds(-1); }},
  };
}

std::vector<BadConfig> BadCaches() {
  const char* text =
      "The text holds what XML cannot carry: a control character or bytes that are not UTF-8.";
  return {
      {text, [](auto& config) { config.keepFresh = {SpecFor("\x01")}; }},
      {"The capacity of the cache is 0.", [](auto& config) { config.cache.capacity = 0; }},
      {"The lifetime of the token is not positive.",
       [](auto& config) { config.keepFresh = {TokenSpec()}; }},
      {"More tokens are to be kept fresh than the cache has room for.",
       [](auto& config) {
         config.cache.capacity = 1;
         config.keepFresh.resize(2);
       }},
  };
}

TEST(ConfigCheckTest, GoodConfigIsAccepted) {
  EXPECT_NO_THROW(CheckConfig(Good()));
  TokenSourceConfig config = Good();
  config.holderOfKey = Key();
  config.login = CertificateLogin{};
  EXPECT_NO_THROW(CheckConfig(config));
}

TEST(ConfigCheckTest, BadConfigIsRefusedWithItsReason) {
  for (const auto& group : {BadLogins(), BadRefreshes(), BadRetries(), BadCaches()}) {
    for (const BadConfig& bad : group) {
      TokenSourceConfig config = Good();
      bad.spoil(config);
      try {
        CreateTokenSource(config);
        ADD_FAILURE() << bad.message;
      } catch (const Tarnik::InvalidArgumentException& refusal) {
        EXPECT_EQ(refusal.Message(), bad.message);
      }
    }
  }
}

TEST(ConfigCheckTest, EndpointsOfOneSchemeAreAccepted) {
  TokenSourceConfig config = Good();
  config.endpoints.push_back({"HTTPS://other.example.com:444/sts", ""});
  EXPECT_NO_THROW(CheckConfig(config));
  config.endpoints = {{"http://a.example.com", ""}, {"http://b.example.com", ""}};
  EXPECT_NO_THROW(CheckConfig(config));
}

TEST(ConfigCheckTest, EveryTextOfASpecIsRead) {
  const std::string bad = "\xff";
  TokenSpec spec = SpecFor("good");
  EXPECT_NO_THROW(CheckTexts(spec));
  spec.delegateTo = bad;
  EXPECT_THROW(CheckTexts(spec), Tarnik::InvalidArgumentException);
  spec.delegateTo = "good";
  const AdviceAttribute good{"name", {"value"}};
  for (const auto& advice : {Advice{bad, {good}}, Advice{"source", {{bad, {}}}},
                             Advice{"source", {{"name", {"value", bad}}}}}) {
    spec.advice = {advice};
    EXPECT_THROW(CheckTexts(spec), Tarnik::InvalidArgumentException);
  }
  spec.advice = {Advice{"source", {good}}};
  EXPECT_NO_THROW(CheckTexts(spec));
}

TEST(ConfigCheckTest, TokenLoginNeedsAKeyAndASpec) {
  TokenSourceConfig config = Good();
  TokenLogin login;
  const auto runtime = std::make_shared<Testing::VirtualRuntime>();
  const auto shared = std::make_shared<const TokenSourceConfig>(Good());
  login.source = std::make_shared<TokenSourceImpl>([=] {
    return Core::Parts{shared, runtime, {}};
  });
  config.login = login;
  EXPECT_THROW(CheckConfig(config), Tarnik::InvalidArgumentException);
  config.holderOfKey = Key();
  EXPECT_THROW(CheckConfig(config), Tarnik::InvalidArgumentException);
  login.spec.tokenLifetimeSec = 60;
  config.login = login;
  EXPECT_NO_THROW(CheckConfig(config));
}

TEST(ConfigCheckTest, CertificateLoginCannotRequestABearerToken) {
  TokenSpec spec;
  spec.tokenLifetimeSec = 1;
  spec.confirmation = CONFIRMATION_BEARER;
  EXPECT_NO_THROW(CheckSpec(spec, PasswordLogin{}));
  EXPECT_THROW(CheckSpec(spec, CertificateLogin{}), Tarnik::InvalidArgumentException);
}

}  // namespace

}  // namespace SsoClient::Access
