#include "token/validity_rules.h"

#include <limits>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/principal_id.h>
#include <tarnik/system/date_time.h>

#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::DateTime;
using Tarnik::System::DateTimeFromUtc;

constexpr long kSecond = 1'000'000;
constexpr long kStart = 1'709'622'489'010'000;  // 2024-03-05T07:08:09.010Z
constexpr long kEnd = kStart + 3600 * kSecond;
constexpr long kLongest = std::numeric_limits<long>::max();
constexpr long kShortest = std::numeric_limits<long>::min();

DateTime At(long microseconds) {
  return DateTimeFromUtc(microseconds, false);
}

ParsedAssertion ValidAssertion() {
  ParsedAssertion assertion;
  assertion.version = "2.0";
  assertion.id = "_a1";
  assertion.subject.notOnOrAfter = At(kEnd);
  assertion.conditions.notBefore = At(kStart);
  assertion.conditions.notOnOrAfter = At(kEnd);
  return assertion;
}

// The error message; "" if the assertion is accepted.
std::string Refusal(const ParsedAssertion& assertion, long tolerance = 600, long now = kStart) {
  try {
    CheckValidity(assertion, tolerance, At(now));
  } catch (const ParseException&) {
    return ThrownMessage<ParseException>([&] { CheckValidity(assertion, tolerance, At(now)); });
  }
  return "";
}

constexpr char kInFuture[] = "Token start date is in the future: 2024-03-05T07:08:09.010Z";
constexpr char kExpired[] = "The token has expired at: 2024-03-05T08:08:09.010Z";

TEST(CheckValidityTest, AcceptsOnlyVersion20) {
  EXPECT_EQ(Refusal(ValidAssertion()), "");
  for (const char* version : {"2.0 ", " 2.0", "2", "2.00", "1.1", ""}) {
    ParsedAssertion assertion = ValidAssertion();
    assertion.version = version;
    EXPECT_EQ(Refusal(assertion), "Invalid token version") << version;
  }
}

TEST(CheckValidityTest, RequiresAnIdThatBeginsWithAnUnderscore) {
  for (const char* id : {"", "a1", " _a1", "-_"}) {
    ParsedAssertion assertion = ValidAssertion();
    assertion.id = id;
    EXPECT_EQ(Refusal(assertion), "Invalid token ID") << id;
  }
  ParsedAssertion underscore = ValidAssertion();
  underscore.id = "_";
  EXPECT_EQ(Refusal(underscore), "");
}

TEST(CheckValidityTest, RequiresAPeriodThatIsNotEmpty) {
  const std::string message =
      "Unsatisfiable token validity conditions: NotBefore must be less than NotOnOrAfter.";
  for (const long end : {kStart, kStart - 1}) {
    ParsedAssertion assertion = ValidAssertion();
    assertion.conditions.notOnOrAfter = At(end);
    for (const long now : {kStart, kEnd + 1'000'000 * kSecond}) {
      EXPECT_EQ(Refusal(assertion, 600, now), message);
    }
  }
  ParsedAssertion shortest = ValidAssertion();
  shortest.conditions.notOnOrAfter = At(kStart + 1);
  EXPECT_EQ(Refusal(shortest), "");
}

struct ClockCase {
  long now;
  long tolerance;
  std::string refusal;
};

class CheckValidityAtTimeTest : public testing::TestWithParam<ClockCase> {};

TEST_P(CheckValidityAtTimeTest, ChecksThePeriod) {
  EXPECT_EQ(Refusal(ValidAssertion(), GetParam().tolerance, GetParam().now), GetParam().refusal);
}

INSTANTIATE_TEST_SUITE_P(
    Clock, CheckValidityAtTimeTest,
    testing::Values(
        // the start
        ClockCase{kStart, 0, ""}, ClockCase{kStart - 1, 0, kInFuture},
        ClockCase{kStart - 300 * kSecond, 600, ""}, ClockCase{kStart - 600 * kSecond, 600, ""},
        ClockCase{kStart - 600 * kSecond - 1, 600, kInFuture},
        ClockCase{kStart - 660 * kSecond, 600, kInFuture},
        // the end
        ClockCase{kEnd - 1, 0, ""}, ClockCase{kEnd, 0, kExpired},
        ClockCase{kEnd + 540 * kSecond, 600, ""}, ClockCase{kEnd + 600 * kSecond - 1, 600, ""},
        ClockCase{kEnd + 600 * kSecond, 600, kExpired},
        // a negative tolerance narrows the period
        ClockCase{kStart + 1, -1, kInFuture}, ClockCase{kStart + kSecond, -1, ""},
        ClockCase{kEnd - kSecond, -1, kExpired}, ClockCase{kEnd - kSecond - 1, -1, ""},
        // tolerances that do not fit into 64 bits of microseconds
        ClockCase{kEnd + 1'000'000 * kSecond, kLongest, ""},
        ClockCase{kStart - 1'000'000 * kSecond, kLongest, ""},
        ClockCase{kStart + 1, kShortest, kInFuture},
        ClockCase{kEnd + 1, kLongest / kSecond + 1, ""}));

// The text form of a time is in the zone in which it was written.
TEST(CheckValidityTest, ReportsTimesAsTheyAreWrittenInTheToken) {
  ParsedAssertion assertion = ValidAssertion();
  assertion.conditions.notBefore = DateTime::Parse("2024-03-05T09:08:09.010+02:00");
  assertion.conditions.notOnOrAfter = DateTime::Parse("2024-03-05T03:08:09.010-05:00");
  EXPECT_EQ(Refusal(assertion, 0, kStart - 1),
            "Token start date is in the future: 2024-03-05T09:08:09.010+02:00");
  EXPECT_EQ(Refusal(assertion, 0, kEnd), "The token has expired at: 2024-03-05T03:08:09.010-05:00");
  EXPECT_EQ(Refusal(assertion, 0, kEnd - 1), "");
}

TEST(CheckValidityTest, RequiresABearerConfirmationAsLongAsTheToken) {
  ParsedAssertion assertion = ValidAssertion();
  EXPECT_EQ(Refusal(assertion), "");
  assertion.subject.notOnOrAfter = At(kEnd - 1);
  EXPECT_EQ(Refusal(assertion), "Invalid token subject validity");
  assertion.subject.notOnOrAfter = At(kEnd + 1);
  EXPECT_EQ(Refusal(assertion), "");
}

TEST(CheckValidityTest, IgnoresTheConfirmationPeriodOfHolderOfKey) {
  ParsedAssertion assertion = ValidAssertion();
  assertion.subject.confirmationMethod = HOLDER_OF_KEY;
  assertion.subject.notOnOrAfter = At(0);
  EXPECT_EQ(Refusal(assertion), "");
}

std::vector<Delegate> Chain() {
  return {{{"first", "d"}, At(kStart)}, {{"second", "d"}, At(kStart)}};
}

TEST(CheckValidityTest, RequiresDelegateIdAndRestrictionTogether) {
  ParsedAssertion restriction = ValidAssertion();
  restriction.conditions.delegationChain = Chain();
  EXPECT_EQ(Refusal(restriction),
            "Token has delegation restriction, but no delegate id is present in the "
            "SubjectConfirmation");
  ParsedAssertion delegateId = ValidAssertion();
  delegateId.subject.delegateId = PrincipalId{"second", "d"};
  EXPECT_EQ(Refusal(delegateId),
            "Token SubjectConfirmation contains delegate id, but no delegation restriction is "
            "present");
}

TEST(CheckValidityTest, RequiresTheDelegateIdOfTheLastDelegate) {
  ParsedAssertion assertion = ValidAssertion();
  assertion.conditions.delegationChain = Chain();
  assertion.subject.delegateId = PrincipalId{"second", "d"};
  EXPECT_EQ(Refusal(assertion), "");
  const PrincipalId others[] = {{"first", "d"},
                                {"second", "e"},
                                {"Second", "d"},
                                {"second", "D"},
                                {"secon", "d"},
                                {"second", ""},
                                {std::string("second\0", 7), "d"},
                                {"second", std::string("d\0d", 3)}};
  for (const PrincipalId& other : others) {
    assertion.subject.delegateId = other;
    EXPECT_EQ(Refusal(assertion),
              "The SubjectConfirmation delegate id does not match the id of the last delegate");
  }
  assertion.conditions.delegationChain = std::vector<Delegate>();
  EXPECT_EQ(Refusal(assertion),
            "The SubjectConfirmation delegate id does not match the id of the last delegate");
}

TEST(CheckValidityTest, AppliesItsRulesInOrder) {
  ParsedAssertion assertion;
  assertion.version = "1.1";
  assertion.id = "a1";
  assertion.conditions.notBefore = At(kStart);
  assertion.conditions.notOnOrAfter = At(kStart);
  assertion.conditions.delegationChain = Chain();
  const long tooEarly = kStart - 1000 * kSecond;
  EXPECT_EQ(Refusal(assertion, 0, tooEarly), "Invalid token version");
  assertion.version = "2.0";
  EXPECT_EQ(Refusal(assertion, 0, tooEarly), "Invalid token ID");
  assertion.id = "_a1";
  EXPECT_EQ(Refusal(assertion, 0, tooEarly),
            "Unsatisfiable token validity conditions: NotBefore must be less than NotOnOrAfter.");
  assertion.conditions.notOnOrAfter = At(kEnd);
  EXPECT_EQ(Refusal(assertion, 0, tooEarly), kInFuture);
  EXPECT_EQ(Refusal(assertion, -4000, kEnd - kSecond), kInFuture);
  EXPECT_EQ(Refusal(assertion, 0, kEnd), kExpired);
  EXPECT_EQ(Refusal(assertion, 0, kStart), "Invalid token subject validity");
  assertion.subject.notOnOrAfter = At(kEnd);
  EXPECT_EQ(Refusal(assertion, 0, kStart),
            "Token has delegation restriction, but no delegate id is present in the "
            "SubjectConfirmation");
}

}  // namespace
}  // namespace SsoClient::Testing
