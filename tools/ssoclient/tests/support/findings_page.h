#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_FINDINGS_PAGE_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_FINDINGS_PAGE_H

#include <map>
#include <set>
#include <string>
#include <vector>

namespace SsoClient::Tool::Testing {

/// A finding of `doctor` as docs/tool.md describes it.
struct DocumentedFinding {
  std::string name{};
  std::set<std::string> steps{};  ///< or "any"
  std::set<int> statuses{};
  bool mayBeWarning = false;
};

/// The rows of the table of findings; a row for several findings gives several. Throws
/// `std::runtime_error` when the page has no such table.
const std::vector<DocumentedFinding>& DocumentedFindings();

/// The members of "details" in the page's table, by step. Throws `std::runtime_error` if there are
/// none. In a name, "." is before a member, and "[]" after a list.
std::map<std::string, std::set<std::string>> DocumentedDetails();

}  // namespace SsoClient::Tool::Testing

#endif
