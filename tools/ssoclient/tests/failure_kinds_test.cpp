#include "failure_kinds.h"

#include <algorithm>
#include <fstream>
#include <set>
#include <sstream>
#include <stdexcept>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/access/failure_kind.h>

namespace SsoClient::Tool {
namespace {

/// The names in the first column of the table in the section "Kinds of failures" of docs/tool.md.
std::multiset<std::string> DocumentedKinds() {
  std::ifstream page(SSOCLIENT_TOOL_PAGE);
  std::multiset<std::string> kinds;
  bool isInside = false;
  for (std::string line; std::getline(page, line);) {
    if (line.starts_with("#")) {
      isInside = line == "### Kinds of failures";
    }
    const std::string column = line.substr(0, line.find('|', 1));
    std::istringstream parts(isInside && line.starts_with("| `") ? column : std::string());
    std::string text;
    // Names are between every other pair of backticks.
    for (bool isName = false; std::getline(parts, text, '`'); isName = !isName) {
      if (isName) {
        kinds.insert(text);
      }
    }
  }
  return kinds;
}

TEST(FailureKindsTest, ThePageDescribesEachOnce) {
  EXPECT_EQ(DocumentedKinds(),
            (std::multiset<std::string>{kFailureKinds.begin(), kFailureKinds.end()}));
}

TEST(FailureKindsTest, AreSortedAndFound) {
  EXPECT_TRUE(std::is_sorted(kFailureKinds.begin(), kFailureKinds.end()));
  for (const std::string_view kind : kFailureKinds) {
    EXPECT_EQ(KindName::Find(kind).Text(), kind);
  }
  EXPECT_THROW(KindName::Find("key-file-close"), std::logic_error);
  EXPECT_THROW(KindName::Find("zzz"), std::logic_error);
}

TEST(FailureKindsTest, ThoseOfTheLibraryAreListed) {
  using Access::FailureKind;
  for (const FailureKind kind :
       {FailureKind::kUnreachable, FailureKind::kTlsTrust, FailureKind::kTlsName, FailureKind::kTls,
        FailureKind::kTimedOut, FailureKind::kCutOff, FailureKind::kHttpStatus,
        FailureKind::kBadAnswer, FailureKind::kFault, FailureKind::kRefusedLogin,
        FailureKind::kExpiredPassword, FailureKind::kBadToken, FailureKind::kAbandoned,
        FailureKind::kLocal}) {
    EXPECT_EQ(KindName::Find(Access::NameOf(kind)).Text(), Access::NameOf(kind));
  }
}

}  // namespace
}  // namespace SsoClient::Tool
