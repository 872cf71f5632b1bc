#ifndef SSOCLIENT_TOOL_OPTIONS_REQUEST_OPTIONS_H
#define SSOCLIENT_TOOL_OPTIONS_REQUEST_OPTIONS_H

#include <cstdint>
#include <string>
#include <vector>

#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>

#include "failure.h"
#include "input/standard_input.h"
#include "input/token_file.h"

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// Adds --lifetime to the command. `seconds` is then positive and in the range of `ParseDuration`.
void AddLifetimeOption(CLI::App& command, std::int64_t& seconds);

/// The token that is requested.
class RequestOptions {
 public:
  /// Adds --lifetime, --audience, --renewable, --delegable, --delegate-to and --act-as.
  void AddTo(CLI::App& command);
  /// Adds --bearer and --holder-of-key, which exclude each other.
  void AddConfirmationTo(CLI::App& command);

  bool WantsBearer() const { return isBearer_; }
  bool WantsHolderOfKey() const { return isHolderOfKey_; }

  /// The act-as token.
  Input ActAsInput() const { return {"--act-as", IsStandardStream(actAsFile_)}; }

  /// The request. Reads the act-as token, which others must not be able to read, unless
  /// `mayBeOpen`. Throws `ToolException` when that fails.
  TokenSpec MakeSpec(bool mayBeOpen) const;

 private:
  std::vector<std::string> audiences_;
  std::string delegateTo_;
  std::string actAsFile_;
  std::int64_t lifetimeSec_ = 0;
  bool isRenewable_ = false;
  bool isDelegable_ = false;
  bool isBearer_ = false;
  bool isHolderOfKey_ = false;
};

/// Throws a failure of the request again. If the service has refused it because a token that it is
/// based on is not delegable, the remedy says so. `own` is the token that is exchanged, or null.
[[noreturn]] void RethrowWithRemedy(const ToolException& exception, const TokenSpec& spec,
                                    const SamlToken* own);

}  // namespace SsoClient::Tool

#endif
