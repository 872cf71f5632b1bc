#include "attempts/answer_headers.h"

#include <gtest/gtest.h>

namespace SsoClient::Access {
namespace {

using namespace std::chrono_literals;

// 2024-03-05T07:08:09Z
constexpr WallTime kNow(1709622489s);

TEST(AnswerHeadersTest, ReadsTheThreeFormsOfDates) {
  // The examples of RFC 9110, section 5.6.7.
  for (const char* text : {"Sun, 06 Nov 1994 08:49:37 GMT", "Sunday, 06-Nov-94 08:49:37 GMT",
                           "Sun Nov  6 08:49:37 1994"}) {
    const auto date = ParseHttpDate(text, kNow);
    ASSERT_TRUE(date) << text;
    EXPECT_EQ(FormatWallTime(*date), "1994-11-06T08:49:37.000Z") << text;
  }
  EXPECT_EQ(ParseHttpDate("Tue, 05 Mar 2024 07:08:09 GMT", kNow), kNow);
  EXPECT_EQ(ParseHttpDate("Tue Mar 15 07:08:09 2024", kNow), kNow + 240h);
  EXPECT_EQ(ParseHttpDate("Thu, 29 Feb 2024 23:59:60 GMT", kNow),
            ParseHttpDate("Fri, 01 Mar 2024 00:00:00 GMT", kNow));
}

TEST(AnswerHeadersTest, ReadsDatesInAllYears) {
  EXPECT_EQ(FormatWallTime(*ParseHttpDate("Sat, 01 Jan 0001 00:00:00 GMT", kNow)),
            "0001-01-01T00:00:00.000Z");
  EXPECT_EQ(FormatWallTime(*ParseHttpDate("Fri, 31 Dec 9999 23:59:59 GMT", kNow)),
            "9999-12-31T23:59:59.000Z");
}

TEST(AnswerHeadersTest, YearsOfTwoDigitsAreAtMostFiftyYearsAhead) {
  EXPECT_EQ(FormatWallTime(*ParseHttpDate("Friday, 01-Jan-74 00:00:00 GMT", kNow)),
            "2074-01-01T00:00:00.000Z");
  EXPECT_EQ(FormatWallTime(*ParseHttpDate("Friday, 01-Jan-75 00:00:00 GMT", kNow)),
            "1975-01-01T00:00:00.000Z");
}

TEST(AnswerHeadersTest, IgnoresWhatIsNotADate) {
  for (const char* text :
       {"", "now", "Sun", "Sun, 06 Nov 1994 08:49:37", "Sun, 06 Nov 1994 08:49:37 UTC",
        "Sun, 06 Nov 1994 08:49:37 GMT ", " Sun, 06 Nov 1994 08:49:37 GMT",
        "Sun, 6 Nov 1994 08:49:37 GMT", "Sun, 06 nov 1994 08:49:37 GMT",
        "Sun, 31 Feb 1994 08:49:37 GMT", "Sun, 00 Nov 1994 08:49:37 GMT",
        "Sun, 06 Nov 1994 24:49:37 GMT", "Sun, 06 Nov 1994 08:60:37 GMT",
        "Sun, 06 Nov 1994 08:49:61 GMT", "Sun, 06 Nov 19x4 08:49:37 GMT",
        "Sunday, 06-Nov-1994 08:49:37 GMT", "Sun Nov 6 08:49:37 1994", "1994-11-06T08:49:37Z"}) {
    EXPECT_FALSE(ParseHttpDate(text, kNow)) << text;
  }
}

TEST(AnswerHeadersTest, RetryAfterIsInSecondsOrADate) {
  EXPECT_EQ(ParseRetryAfter("0", kNow), 0ms);
  EXPECT_EQ(ParseRetryAfter("120", kNow), 120s);
  EXPECT_EQ(ParseRetryAfter("0000000000120", kNow), 120s);
  EXPECT_EQ(ParseRetryAfter("Tue, 05 Mar 2024 07:10:09 GMT", kNow), 120s);
  EXPECT_EQ(ParseRetryAfter("Tue, 05 Mar 2024 07:08:08 GMT", kNow), 0ms);
}

TEST(AnswerHeadersTest, RetryAfterIsAtMostAYear) {
  for (const char* text : {"31536001", "99999999", "100000000", "99999999999999999999999999",
                           "Fri, 31 Dec 9999 23:59:59 GMT"}) {
    EXPECT_EQ(ParseRetryAfter(text, kNow), std::chrono::hours(24 * 365)) << text;
  }
}

TEST(AnswerHeadersTest, IgnoresARetryAfterOfAnotherForm) {
  for (const char* text : {"", "-1", "+1", "1.5", "1 ", "soon", "0x10"}) {
    EXPECT_EQ(ParseRetryAfter(text, kNow), 0ms) << text;
  }
}

TEST(AnswerHeadersTest, AnOffsetIsTheLeastThatExplainsTheDate) {
  EXPECT_EQ(EstimateClockOffset(kNow, kNow, kNow), 0ms);
  EXPECT_EQ(EstimateClockOffset(kNow, kNow + 300ms, kNow + 999ms), 0ms);
  EXPECT_EQ(EstimateClockOffset(kNow, kNow - 3s, kNow), 0ms);
  EXPECT_EQ(EstimateClockOffset(kNow, kNow - 5s, kNow - 2s), 2s);
  EXPECT_EQ(EstimateClockOffset(kNow, kNow + 5s, kNow + 8s), -4s);
  EXPECT_EQ(EstimateClockOffset(kNow + 90s, kNow - 100ms, kNow), 90s);
}

TEST(AnswerHeadersTest, FormatsTimes) {
  EXPECT_EQ(FormatWallTime(kNow + 10ms), "2024-03-05T07:08:09.010Z");
}

}  // namespace
}  // namespace SsoClient::Access
