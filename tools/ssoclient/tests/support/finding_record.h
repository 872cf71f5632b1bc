#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_FINDING_RECORD_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_FINDING_RECORD_H

#include <set>
#include <string>

namespace SsoClient::Tool::Testing {

/// Records that the real program reported this finding and that a test expected it. The record is
/// the folder in the environment variable SSOCLIENT_TOOL_FINDINGS, which several test processes
/// write to; without it, nothing is recorded.
void RecordFinding(const std::string& name);

/// All that the processes recorded. Throws `std::filesystem::filesystem_error` if there is no such
/// folder.
std::set<std::string> RecordedFindings(const std::string& folder);

}  // namespace SsoClient::Tool::Testing

#endif
