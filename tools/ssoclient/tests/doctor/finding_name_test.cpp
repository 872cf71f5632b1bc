// Each finding is described in docs/tool.md, and reported by the real program in a test.
#include "doctor/finding_name.h"

#include <cstdlib>
#include <set>
#include <string>

#include <gtest/gtest.h>

#include "support/finding_record.h"
#include "support/findings_page.h"
#include "support/private_network.h"

namespace SsoClient::Tool::Testing {
namespace {

using Doctor::FindingName;
using Doctor::kFindingNames;

// After the tests of the program, whose record is in this folder.
TEST(FindingNameTest, EachWasReportedByTheProgram) {
  const char* const folder = std::getenv("SSOCLIENT_TOOL_RECORDED_FINDINGS");
  if (folder == nullptr) {
    GTEST_SKIP() << "the test tool.findings compares the record of all tests of the program";
  }
  const std::string obstacle = PrivateNetworkObstacle();
  if (!obstacle.empty()) {
    GTEST_SKIP() << "not all problems can be produced here: " << obstacle;
  }
  const std::set<std::string> recorded = RecordedFindings(folder);
  for (const std::string_view name : kFindingNames) {
    EXPECT_TRUE(recorded.contains(std::string(name))) << name;
  }
}

TEST(FindingNameTest, TheSameAreDescribed) {
  std::set<std::string> described;
  for (const DocumentedFinding& finding : DocumentedFindings()) {
    described.insert(finding.name);
    EXPECT_FALSE(finding.statuses.empty()) << finding.name;
  }
  EXPECT_EQ(described, std::set<std::string>(kFindingNames.begin(), kFindingNames.end()));
}

TEST(FindingNameTest, OnlyOnesOfTheListAreFound) {
  EXPECT_EQ(FindingName::FindOr("unknown-host", "refused").Text(), "unknown-host");
  EXPECT_EQ(FindingName::FindOr("dns", "refused").Text(), "refused");
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
