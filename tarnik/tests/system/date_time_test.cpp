#include <chrono>
#include <cstddef>
#include <cstdlib>
#include <ctime>
#include <limits>
#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/date_time.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::System;

struct Accepted {
  const char* text;
  const char* inUtc;
};

class AcceptedDateTimeTest : public testing::TestWithParam<Accepted> {};

TEST_P(AcceptedDateTimeTest, DenotesThisInstant) {
  const DateTime parsed = DateTime::Parse(GetParam().text);
  EXPECT_EQ(DateTimeFromUtc(parsed.GetUtcTime(), false).ToString(), GetParam().inUtc);
}

INSTANTIATE_TEST_SUITE_P(
    Texts, AcceptedDateTimeTest,
    testing::Values(Accepted{"2024-03-05T07:08:09Z", "2024-03-05T07:08:09.000Z"},
                    Accepted{"2024-03-05T07:08:09.010Z", "2024-03-05T07:08:09.010Z"},
                    Accepted{"2024-03-05T07:08:09.5", "2024-03-05T07:08:09.500Z"},
                    Accepted{"2024-03-05T07:08:09.123456Z", "2024-03-05T07:08:09.123456Z"},
                    Accepted{"2024-03-05T07:08:09.1234569Z", "2024-03-05T07:08:09.123456Z"},
                    Accepted{"2024-03-05T07:08:09", "2024-03-05T07:08:09.000Z"},
                    Accepted{"2024-03-05T07:08:09+02:30", "2024-03-05T04:38:09.000Z"},
                    Accepted{"2024-03-05T07:08:09-14:00", "2024-03-05T21:08:09.000Z"},
                    Accepted{"2024-03-05T07:08:09+14:00", "2024-03-04T17:08:09.000Z"},
                    Accepted{"2024-03-05T07:08:09-00:00", "2024-03-05T07:08:09.000Z"},
                    Accepted{"2023-12-31T24:00:00Z", "2024-01-01T00:00:00.000Z"},
                    Accepted{"2024-02-29T00:00:00Z", "2024-02-29T00:00:00.000Z"},
                    Accepted{"2000-02-29T00:00:00Z", "2000-02-29T00:00:00.000Z"},
                    Accepted{"0001-01-01T00:00:00Z", "0001-01-01T00:00:00.000Z"},
                    Accepted{"9999-12-31T23:59:59.999999Z", "9999-12-31T23:59:59.999999Z"},
                    Accepted{"1969-12-31T23:59:59.999999Z", "1969-12-31T23:59:59.999999Z"}));

class RefusedDateTimeTest : public testing::TestWithParam<const char*> {};

TEST_P(RefusedDateTimeTest, IsNotADateTime) {
  EXPECT_THROW(DateTime::Parse(GetParam()), DateTimeFormatException);
}

INSTANTIATE_TEST_SUITE_P(
    Texts, RefusedDateTimeTest,
    testing::Values("", "2024", "2024-03-05", "2024-03-05T07:08Z", "2024-03-05T07:08:60Z",
                    "2016-12-31T23:59:60Z", "2024-03-05T24:00:01Z", "2024-03-05T24:00:00.1Z",
                    "2024-03-05T24:01:00Z", "2024-03-05T25:00:00Z", "2024-03-05T07:60:09Z",
                    "0000-01-01T00:00:00Z", "-0001-01-01T00:00:00Z", "10000-01-01T00:00:00Z",
                    "2023-02-29T00:00:00Z", "1900-02-29T00:00:00Z", "2024-04-31T00:00:00Z",
                    "2024-00-10T00:00:00Z", "2024-13-10T00:00:00Z", "2024-01-00T00:00:00Z",
                    "2024-03-05T07:08:09z", "2024-03-05t07:08:09Z", "2024-03-05 07:08:09Z",
                    "2024-03-05T07:08:09+14:01", "2024-03-05T07:08:09-14:01",
                    "2024-03-05T07:08:09+15:00", "2024-03-05T07:08:09+02:60",
                    "2024-03-05T07:08:09+2:00", "2024-03-05T07:08:09+0200", " 2024-03-05T07:08:09Z",
                    "2024-03-05T07:08:09Z ", "2024-03-05T07:08:09.Z", "2024-03-05T07:08:09,5Z",
                    "2024-3-5T07:08:09Z", "+2024-03-05T07:08:09Z", "2024-03-05T07:08:09ZZ",
                    "2024-03-05T-7:08:09Z", "0001-01-01T00:00:00+00:01",
                    "9999-12-31T23:59:59-00:01", "9999-12-31T24:00:00Z"));

TEST(DateTimeTest, EveryPrefixOfAValidTextIsRefusedOrAWholeDateTime) {
  const std::string good = "2024-03-05T07:08:09.010+02:00";
  const std::size_t wholeSeconds = std::string("2024-03-05T07:08:09").size();
  for (std::size_t length = 0; length < good.size(); ++length) {
    const bool isWhole =
        length == wholeSeconds || (length >= wholeSeconds + 2 && length <= wholeSeconds + 4);
    if (isWhole) {
      EXPECT_NO_THROW(DateTime::Parse(good.substr(0, length))) << length;
    } else {
      EXPECT_THROW(DateTime::Parse(good.substr(0, length)), DateTimeFormatException) << length;
    }
  }
}

TEST(DateTimeTest, ReturnsFieldsAndTextInItsOwnZone) {
  const DateTime time = DateTime::Parse("2024-03-05T07:08:09.010007+02:00");
  const auto fields = time.GetFields();
  EXPECT_EQ(fields.century, 20);
  EXPECT_EQ(fields.yearOfCentury, 24);
  EXPECT_EQ(fields.month, 3);
  EXPECT_EQ(fields.day, 5);
  EXPECT_EQ(fields.hour, 7);
  EXPECT_EQ(fields.minute, 8);
  EXPECT_EQ(fields.second, 9);
  EXPECT_EQ(fields.millisecond, 10);
  EXPECT_EQ(fields.microsecond, 7);
  EXPECT_EQ(time.Bias(), 120);
  EXPECT_EQ(time.ToShortStringBias(), "+02:00");
  EXPECT_EQ(time.ToString(), "2024-03-05T07:08:09.010007+02:00");
  EXPECT_EQ(DateTime::Parse("2024-03-05T07:08:09-03:30").ToShortStringBias(), "-03:30");
  EXPECT_EQ(DateTime().ToShortStringBias(), "Z");
}

TEST(DateTimeTest, ComparesInstantsIndependentlyOfTheZone) {
  const DateTime utc = DateTime::Parse("2024-03-05T05:00:00Z");
  const DateTime east = DateTime::Parse("2024-03-05T07:00:00+02:00");
  const DateTime later = DateTime::Parse("2024-03-05T05:00:00.000001Z");
  EXPECT_TRUE(utc == east);
  EXPECT_TRUE(utc < later && later > utc && utc <= east && east >= utc && utc != later);
}

TEST(DateTimeTest, PrintedTextParsesToTheSameInstant) {
  for (long time = -62'135'596'800'000'000; time < 253'402'300'799'999'999;
       time += 9'876'543'210'123'457) {
    EXPECT_EQ(DateTime::Parse(DateTimeFromUtc(time, false).ToString()).GetUtcTime(), time);
  }
}

TEST(DateTimeFromUtcTest, ClampsInstantsBeyondTheRange) {
  EXPECT_EQ(DateTimeFromUtc(std::numeric_limits<long>::max(), false).ToString(),
            "9999-12-31T23:59:59.999999Z");
  EXPECT_EQ(DateTimeFromUtc(std::numeric_limits<long>::min(), false).ToString(),
            "0001-01-01T00:00:00.000Z");
}

TEST(DateTimeFromUtcTest, UsesTheLocalZoneOnRequest) {
  const char* before = std::getenv("TZ");
  const std::string saved = before == nullptr ? "" : before;
  setenv("TZ", "XYZ-5:30", 1);
  tzset();
  const DateTime local = DateTimeFromUtc(0, true);
  EXPECT_EQ(local.ToString(), "1970-01-01T05:30:00.000+05:30");
  EXPECT_EQ(local.GetUtcTime(), 0);
  before == nullptr ? unsetenv("TZ") : setenv("TZ", saved.c_str(), 1);
  tzset();
}

TEST(GetUtcDateTimeTest, AgreesWithTheSystemClock) {
  const auto microseconds = [] {
    return std::chrono::duration_cast<std::chrono::microseconds>(
               std::chrono::system_clock::now().time_since_epoch())
        .count();
  };
  const long before = microseconds();
  const DateTime now = GetUtcDateTime();
  EXPECT_GE(now.GetUtcTime(), before);
  EXPECT_LE(now.GetUtcTime(), microseconds());
  EXPECT_EQ(now.Bias(), 0);
}

TEST(SaturatingArithmeticTest, StopsAtTheEndsOfTheRange) {
  constexpr long kMax = std::numeric_limits<long>::max();
  constexpr long kMin = std::numeric_limits<long>::min();
  EXPECT_EQ(SaturatingAdd(kMax, 1), kMax);
  EXPECT_EQ(SaturatingAdd(kMin, -1), kMin);
  EXPECT_EQ(SaturatingAdd(5, -7), -2);
  EXPECT_EQ(SaturatingMultiply(kMax, 2), kMax);
  EXPECT_EQ(SaturatingMultiply(kMax, -2), kMin);
  EXPECT_EQ(SaturatingMultiply(kMin, -1), kMax);
  EXPECT_EQ(SaturatingMultiply(600, 1'000'000), 600'000'000);
}

}  // namespace
}  // namespace Tarnik::Testing
