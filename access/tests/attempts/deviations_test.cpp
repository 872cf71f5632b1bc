#include "attempts/deviations.h"

#include <chrono>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "attempts/endpoint_fixture.h"
#include "support/holder_of_key.h"

namespace SsoClient::Access {
namespace {

using namespace std::chrono_literals;
using SsoClient::Testing::ConfigOf;
using SsoClient::Testing::Holder;
using SsoClient::Testing::Stranger;
using SsoClient::Testing::TenMinutes;
using testing::ElementsAre;
using testing::IsEmpty;

std::vector<std::string> Texts(const std::vector<DeviationRecord>& deviations) {
  std::vector<std::string> texts;
  for (const DeviationRecord& deviation : deviations) {
    EXPECT_EQ(deviation.source + deviation.endpoint, "");
    texts.push_back(deviation.field + ": " + deviation.issued + " for " + deviation.requested);
  }
  return texts;
}

/// Tokens that a service issues otherwise than it was asked.
class DeviationsTest : public EndpointTest {
 protected:
  /// What deviates in a token for `spec` after the service has replaced `from` by `to`.
  static std::vector<std::string> AfterEdit(const TokenSpec& spec, const std::string& from,
                                            const std::string& to) {
    DevSts::AssertionOptions options;
    options.beforeSigning = [from, to](std::string& assertion) {
      const std::size_t at = assertion.find(from);
      ASSERT_NE(at, std::string::npos) << assertion;
      assertion.replace(at, from.size(), to);
    };
    return With(options, spec);
  }
  static std::vector<std::string> With(const DevSts::AssertionOptions& options,
                                       const TokenSpec& spec) {
    Sts().SetAssertionOptions(options);
    const AttemptOutcome outcome = AttemptHere(spec);
    EXPECT_NE(outcome.token, nullptr) << outcome.message;
    return Texts(outcome.deviations);
  }

  static Reception JustNow() {
    return {std::chrono::floor<std::chrono::milliseconds>(std::chrono::system_clock::now()), 0ms};
  }
};

TEST_F(DeviationsTest, ATokenAsRequestedHasNone) {
  TokenSpec spec = TenMinutes();
  spec.audienceRestriction = {"https://a.example", "https://b.example"};
  spec.delegable = spec.renewable = true;
  EXPECT_THAT(With({}, spec), IsEmpty());
}

TEST_F(DeviationsTest, AnotherSubject) {
  EXPECT_THAT(AfterEdit(TenMinutes(), "alice@", "mallory@"),
              ElementsAre("subject: mallory@EXAMPLE.COM for alice@EXAMPLE.COM"));
  EXPECT_THAT(AfterEdit(TenMinutes(), "alice@EXAMPLE.COM", "ALICE@example.com"), IsEmpty());
}

TEST_F(DeviationsTest, OtherAudiences) {
  TokenSpec spec = TenMinutes();
  spec.audienceRestriction = {"https://a.example"};
  EXPECT_THAT(AfterEdit(spec, "https://a.example", "https://b.example"),
              ElementsAre("audiences: https://b.example for https://a.example"));
  Sts().SetAssertionOptions({});
  const auto unrestricted = Acquire();
  EXPECT_THAT(Texts(FindDeviations({spec, {}, nullptr}, *unrestricted, JustNow())),
              ElementsAre("audiences: any for https://a.example"));
}

TEST_F(DeviationsTest, AnotherLifetime) {
  DevSts::AssertionOptions options;
  options.maxLifetime = 300s;
  EXPECT_THAT(With(options, TenMinutes()), ElementsAre("lifetime: 300 s for 600 s"));
  options.maxLifetime = 597s;
  EXPECT_THAT(With(options, TenMinutes()), IsEmpty());
}

TEST_F(DeviationsTest, AStartThatIsSetBackDoesNotCount) {
  DevSts::AssertionOptions options;
  options.notBeforeOffset = 300s;
  EXPECT_THAT(With(options, TenMinutes()), IsEmpty());
}

TEST_F(DeviationsTest, LifetimesCountByTheClockOfTheService) {
  const auto token = Acquire();
  Reception reception = JustNow();
  reception.serviceNow += 60s;
  EXPECT_THAT(Texts(FindDeviations({TenMinutes(), {}, nullptr}, *token, reception)).size(), 1U);
  reception.duration = 60s;
  EXPECT_THAT(FindDeviations({TenMinutes(), {}, nullptr}, *token, reception), IsEmpty());
}

TEST_F(DeviationsTest, LifetimesLongerThanAnyTokenAreNoTrouble) {
  TokenSpec spec = TenMinutes();
  spec.tokenLifetimeSec = std::numeric_limits<std::int64_t>::max();
  const auto token = Acquire();
  const auto texts = Texts(FindDeviations({spec, {}, nullptr}, *token, JustNow()));
  EXPECT_THAT(texts, ElementsAre(testing::EndsWith(" s for 9223372036854775807 s")));
}

TEST_F(DeviationsTest, OtherConfirmations) {
  const HolderOfKeyConfig holder = ConfigOf(Holder());
  const HolderOfKeyConfig stranger = ConfigOf(Stranger());
  const auto bearer = Acquire();
  const auto bound = AcquireBound(TenMinutes());
  const TokenSpec spec = TenMinutes();
  const auto of = [&spec](const SamlToken& token, const HolderOfKeyConfig* key) {
    return Texts(FindDeviations({spec, {}, key}, token, JustNow()));
  };
  EXPECT_THAT(of(*bearer, nullptr), IsEmpty());
  EXPECT_THAT(of(*bound, &holder), IsEmpty());
  EXPECT_THAT(of(*bearer, &holder), ElementsAre("confirmation: bearer for holder-of-key"));
  EXPECT_THAT(of(*bound, nullptr), ElementsAre("confirmation: holder-of-key for bearer"));
  EXPECT_THAT(of(*bound, &stranger),
              ElementsAre("confirmation: holder-of-key with another key for holder-of-key"));
}

TEST_F(DeviationsTest, WhatTheTokenPermits) {
  TokenSpec spec = TenMinutes();
  spec.delegable = spec.renewable = true;
  DevSts::AssertionOptions options;
  options.proxyCount = options.renewCount = 0;
  EXPECT_THAT(With(options, spec),
              ElementsAre("delegable: false for true", "renewable: false for true"));
}

TEST_F(DeviationsTest, TextsOfTheServiceAreCleaned) {
  TokenSpec spec = TenMinutes();
  spec.audienceRestriction = {"https://a.example"};
  EXPECT_THAT(AfterEdit(spec, "https://a.example", "a&#10;b" + std::string(2000, 'x')),
              ElementsAre(testing::MatchesRegex("audiences: a\\?bx+\\.\\.\\. for .*")));
}

TEST(SubjectOfTest, OnlyPrincipalNamesAreComparable) {
  const auto principal = SubjectOf("alice@EXAMPLE.COM");
  ASSERT_TRUE(principal);
  EXPECT_EQ(principal->name, "alice");
  EXPECT_EQ(principal->domain, "EXAMPLE.COM");
  for (const char* name : {"", "alice", "EXAMPLE\\alice", "@EXAMPLE.COM", "alice@"}) {
    EXPECT_FALSE(SubjectOf(name)) << name;
  }
}

}  // namespace
}  // namespace SsoClient::Access
