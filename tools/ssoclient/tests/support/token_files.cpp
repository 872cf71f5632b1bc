#include "support/token_files.h"

#include <utility>

#include <sys/stat.h>

namespace SsoClient::Tool::Testing {

DevSts::Credential CredentialOf(const Tarnik::Testing::Identity& identity) {
  return {identity.Pem(), identity.KeyPem()};
}

std::string TokenFiles::Write(const std::string& name, const std::string& content) const {
  std::string path = folder_.Write(name, content);
  chmod(path.c_str(), 0600);
  return path;
}

std::string TokenFiles::WriteToken(const AssertionText& text,
                                   const DevSts::Credential& credential) const {
  return Write("token.xml", text.ToSignedXml(credential));
}

ToolResult RunInUtf8(std::vector<std::string> arguments, const std::string& input) {
  ToolOptions options;
  options.arguments = std::move(arguments);
  options.input = input;
  options.environment = {{"LC_ALL", "C.UTF-8"}};
  return RunTool(options);
}

ToolResult RunOnTerminal(std::vector<std::string> arguments,
                         std::map<std::string, std::optional<std::string>> environment) {
  ToolOptions options;
  options.arguments = std::move(arguments);
  options.environment = std::move(environment);
  options.environment.try_emplace("LC_ALL", "C.UTF-8");
  options.hasTerminal = true;
  options.out = Stream::kTerminal;
  return RunTool(options);
}

}  // namespace SsoClient::Tool::Testing
