#ifndef SSOCLIENT_TOOL_OPTIONS_REQUEST_OPTIONS_H
#define SSOCLIENT_TOOL_OPTIONS_REQUEST_OPTIONS_H

#include <cstdint>
#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <ssoclient/token_spec.h>

namespace CLI {
class App;
}

namespace SsoClient::Tool {

/// The seconds of a duration such as "3600", "90s", "30m", "8h" or "7d"; none for any other text,
/// for nothing and for more than a hundred years.
std::optional<std::int64_t> ParseLifetime(std::string_view text);

/// Adds --lifetime to the command. `seconds` is then in the range of `ParseLifetime`.
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

}  // namespace SsoClient::Tool

#endif
