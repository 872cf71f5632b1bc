#include "xml/request_bodies.h"

#include <gmock/gmock.h>

#include <limits>

#include "support/local_zone.h"
#include "xml/built_xml.h"

namespace SsoClient {
namespace {

using Tarnik::System::DateTime;
using Tarnik::System::GetUtcDateTime;

struct Times {
  DateTime created;
  DateTime expires;
};

Times BuiltTimes(std::int64_t seconds) {
  const auto element = Testing::Built(*BuildLifetime(seconds));
  return {Testing::TimeAt(*element, {"Created"}), Testing::TimeAt(*element, {"Expires"})};
}

TEST(LifetimeTest, HoldsCreatedThenExpiresInUtc) {
  const TestSupport::LocalZone zone;
  EXPECT_EQ(Testing::WithoutTimes(Testing::BuiltXml(*BuildLifetime(600))),
            "<wst:Lifetime xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-utility-1.0.xsd\">"
            "<wsu:Created>TIME</wsu:Created><wsu:Expires>TIME</wsu:Expires></wst:Lifetime>");
}

TEST(LifetimeTest, IsExactlyAsLongAsAsked) {
  for (const std::int64_t seconds : {1L, 600L, 36L * 60, 86'400L * 365}) {
    const auto times = BuiltTimes(seconds);
    EXPECT_EQ(times.expires.GetUtcTime() - times.created.GetUtcTime(), seconds * 1'000'000);
    EXPECT_EQ(times.created.GetFields().millisecond, times.expires.GetFields().millisecond);
  }
}

TEST(LifetimeTest, BeginsNow) {
  const auto before = GetUtcDateTime().GetUtcTime() / 1000;
  const auto created = BuiltTimes(600).created.GetUtcTime() / 1000;
  const auto after = GetUtcDateTime().GetUtcTime() / 1000;
  EXPECT_LE(before, created);
  EXPECT_LE(created, after);
}

TEST(LifetimeTest, ANegativeOneExpiresBeforeItIsCreated) {
  const auto times = BuiltTimes(-60);
  EXPECT_EQ(times.expires.GetUtcTime() - times.created.GetUtcTime(), -60'000'000);
}

TEST(LifetimeTest, AnEndlessOneStopsAtTheEndOfTime) {
  EXPECT_EQ(BuiltTimes(std::numeric_limits<std::int64_t>::max()).expires,
            DateTime::Parse("9999-12-31T23:59:59.999Z"));
}

}  // namespace
}  // namespace SsoClient
