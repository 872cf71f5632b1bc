// Each finding is described in docs/tool.md, and produced by the real program in a test.
#include "doctor/finding_name.h"

#include <filesystem>
#include <fstream>
#include <iterator>
#include <set>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/findings_page.h"

namespace SsoClient::Tool::Testing {
namespace {

using Doctor::FindingName;
using Doctor::kFindingNames;
using testing::HasSubstr;
using testing::Not;

// The tests that only run the program: those of parts of it have no such name.
std::string TestsOfTheProgram() {
  std::string all;
  for (const auto& entry : std::filesystem::directory_iterator(SSOCLIENT_TOOL_DOCTOR_TESTS)) {
    if (entry.path().filename().string().starts_with("doctor_")) {
      std::ifstream file(entry.path());
      all.append(std::istreambuf_iterator<char>(file), {});
    }
  }
  return all;
}

TEST(FindingNameTest, EachIsExpectedInATestOfTheProgram) {
  const std::string tests = TestsOfTheProgram();
  EXPECT_THAT(tests, Not(HasSubstr("#include \"doctor/")));
  for (const std::string_view name : kFindingNames) {
    EXPECT_NE(tests.find('"' + std::string(name) + '"'), std::string::npos) << name;
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
