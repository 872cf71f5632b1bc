#include "input/standard_input.h"

#include <string>
#include <vector>

#include "failure.h"

namespace SsoClient::Tool {
namespace {

void AddNames(std::initializer_list<Input> inputs, std::vector<std::string>& names) {
  for (const Input& input : inputs) {
    if (input.isStandardInput) {
      names.emplace_back(input.name);
    }
  }
}

}  // namespace

void CheckStandardInput(std::initializer_list<Input> tokens, std::initializer_list<Input> secrets) {
  std::vector<std::string> names;
  AddNames(tokens, names);
  if (names.empty()) {
    return;
  }
  AddNames(secrets, names);
  if (names.size() > 1) {
    throw ToolException({ExitStatus::kUsage, "usage",
                         names[0] + " and " + names[1] + " both want standard input",
                         "name a file for one of them"});
  }
}

}  // namespace SsoClient::Tool
