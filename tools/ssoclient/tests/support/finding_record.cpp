#include "support/finding_record.h"

#include <cstdlib>
#include <filesystem>
#include <fstream>

namespace SsoClient::Tool::Testing {

void RecordFinding(const std::string& name) {
  const char* const folder = std::getenv("SSOCLIENT_TOOL_FINDINGS");
  if (folder == nullptr) {
    return;
  }
  std::filesystem::create_directories(folder);
  // The name of the file is the record, so that processes need not take turns.
  std::ofstream(std::filesystem::path(folder) / name);
}

std::set<std::string> RecordedFindings(const std::string& folder) {
  std::set<std::string> names;
  for (const auto& entry : std::filesystem::directory_iterator(folder)) {
    names.insert(entry.path().filename().string());
  }
  return names;
}

}  // namespace SsoClient::Tool::Testing
