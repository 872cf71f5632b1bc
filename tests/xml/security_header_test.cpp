#include "xml/security_header.h"

#include <gmock/gmock.h>

#include "support/local_zone.h"
#include "xml/builders.h"
#include "xml/built_xml.h"

namespace SsoClient {
namespace {

using Tarnik::System::GetUtcDateTime;

TEST(SecurityHeaderTest, HoldsATimestampInUtcAndThenWhatIsAdded) {
  const TestSupport::LocalZone zone;
  const auto header = BuildSecurityHeader(10);
  header->Add(MakeElementBuilder("", "Token"));
  EXPECT_EQ(Testing::WithoutTimes(Testing::BuiltXml(*header)),
            "<wsse:Security xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-secext-1.0.xsd\">"
            "<wsu:Timestamp xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-utility-1.0.xsd\"><wsu:Created>TIME</wsu:Created>"
            "<wsu:Expires>TIME</wsu:Expires></wsu:Timestamp><Token/></wsse:Security>");
}

TEST(SecurityHeaderTest, IsValidFromNowForTheMinutesAsked) {
  const auto before = GetUtcDateTime().GetUtcTime() / 1000;
  const auto header = Testing::Built(*BuildSecurityHeader(10));
  const auto after = GetUtcDateTime().GetUtcTime() / 1000;
  const auto created = Testing::TimeAt(*header, {"Timestamp", "Created"}).GetUtcTime();
  const auto expires = Testing::TimeAt(*header, {"Timestamp", "Expires"}).GetUtcTime();
  EXPECT_LE(before, created / 1000);
  EXPECT_LE(created / 1000, after);
  EXPECT_EQ(expires - created, 600'000'000);
}

TEST(SecurityHeaderTest, WrapsMoreThan35Minutes) {
  const auto header = Testing::Built(*BuildSecurityHeader(36));
  // What is written has no microseconds.
  EXPECT_NEAR(Testing::TimeAt(*header, {"Timestamp", "Expires"}).GetUtcTime() -
                  Testing::TimeAt(*header, {"Timestamp", "Created"}).GetUtcTime(),
              2'160'000'000 - 4'294'967'296, 1000);
}

}  // namespace
}  // namespace SsoClient
