#ifndef SSOCLIENT_TOOL_OUTPUT_TOKEN_OUTPUT_H
#define SSOCLIENT_TOOL_OUTPUT_TOKEN_OUTPUT_H

#include <memory>
#include <string>
#include <vector>

#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>
#include <tarnik/system/date_time.h>

#include "commands/command.h"
#include "output/console.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// A field of an issued token that is not what was asked for.
struct Deviation {
  std::string field{};      ///< "lifetime", "renewable", "delegable", "audiences" or "confirmation"
  std::string requested{};  ///< for people
  std::string issued{};     ///< for people
};

/// Returns the fields of a token, issued at `now`, that differ from `spec`. The lifetime is
/// compared from the token's start and from `now`, with a tolerance of one percent plus two
/// seconds, and differs only if neither matches: a service may set the start back, and clocks may
/// differ.
std::vector<Deviation> FindDeviations(const SamlToken& token, const TokenSpec& spec, bool isBearer,
                                      const Tarnik::System::DateTime& now);

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
