#ifndef SSOCLIENT_TOOL_COMMANDS_TOKEN_OUTPUT_H
#define SSOCLIENT_TOOL_COMMANDS_TOKEN_OUTPUT_H

#include <string>
#include <vector>

#include <ssoclient/saml_token.h>

#include "commands/command.h"
#include "output/console.h"
#include "token/deviations.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// Where a command writes the token that it has received.
class TokenOutput {
 public:
  /// Adds -o and --output to the command. The object must live as long as the command.
  void AddTo(CLI::App& command, const std::string& description);
  /// The path is `path` if the user has named none.
  void SetDefault(const std::string& path);

  /// Throws `ToolException` when the token could certainly not be written, and with the status
  /// `kUsage` when standard output would have to be the token and a JSON object.
  void Check(bool wantsJson) const;

  /// Writes the token, and then for people who it is for, until when, where it is and what is not
  /// as asked for: on standard output, or on standard error if that has the token.
  Outcome Deliver(const Console& console, const SamlToken& token,
                  const std::vector<Deviation>& deviations, bool wantsJson) const;

 private:
  std::string path_;
};

}  // namespace SsoClient::Tool

#endif
