#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_TOKEN_FILES_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_TOKEN_FILES_H

#include <map>
#include <optional>
#include <string>
#include <vector>

#include <devsts/certificates.h>

#include "support/assertion_text.h"
#include "support/run_tool.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace SsoClient::Tool::Testing {

using SsoClient::Testing::AssertionText;
using SsoClient::Testing::Replaced;
using SsoClient::Testing::TrustedCredential;

/// The issuer and one of the audiences of `AssertionText`.
inline constexpr const char* kTokenIssuer = "https://sts.example.com/STS";
inline constexpr const char* kTokenAudience = "https://a.example";

DevSts::Credential CredentialOf(const Tarnik::Testing::Identity& identity);

/// Files for runs of the tool in a folder of their own.
class TokenFiles {
 public:
  /// Writes a file that only its owner can read, and returns its path.
  std::string Write(const std::string& name, const std::string& content) const;
  /// The same for the text, signed by the credential.
  std::string WriteToken(const AssertionText& text,
                         const DevSts::Credential& credential = TrustedCredential()) const;
  std::string Folder() const { return folder_.Path(); }

 private:
  Tarnik::Testing::TemporaryFolder folder_;
};

/// Runs the tool in the locale C.UTF-8.
ToolResult RunInUtf8(std::vector<std::string> arguments, const std::string& input = "");
/// The same with a terminal for standard output; `environment` may choose another locale.
ToolResult RunOnTerminal(std::vector<std::string> arguments,
                         std::map<std::string, std::optional<std::string>> environment = {});

}  // namespace SsoClient::Tool::Testing

#endif
