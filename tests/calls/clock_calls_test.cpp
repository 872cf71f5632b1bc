// Related times are computed from one reading of the clock.
#include <gmock/gmock.h>

#include "calls/recorded_calls.h"
#include "xml/built_xml.h"
#include "xml/request_bodies.h"
#include "xml/security_header.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;

class ClockCallsTest : public testing::Test {
 protected:
  ClockCallsTest() { ForgetCalls(); }
};

constexpr char kTimes[] =
    "<wsu:Created>2024-03-05T07:08:09.010Z</wsu:Created>"
    "<wsu:Expires>2024-03-05T07:18:09.010Z</wsu:Expires>";

TEST_F(ClockCallsTest, ALifetimeUsesOneReadingOfTheClock) {
  EXPECT_THAT(BuiltXml(*BuildLifetime(600)), HasSubstr(kTimes));
  EXPECT_EQ(Recorded().clockReadings, 1);
}

TEST_F(ClockCallsTest, ATimestampUsesOneReadingOfTheClock) {
  EXPECT_THAT(BuiltXml(*BuildSecurityHeader(10)), HasSubstr(kTimes));
  EXPECT_EQ(Recorded().clockReadings, 1);
}

}  // namespace
}  // namespace SsoClient::Testing
