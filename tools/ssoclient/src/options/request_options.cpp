#include "options/request_options.h"

#include <charconv>

#include <CLI/CLI.hpp>

#include "input/token_file.h"
#include "token/unverified_token.h"

namespace SsoClient::Tool {
namespace {

constexpr const char* kDefaultLifetime = "1h";
constexpr std::int64_t kLongestLifetimeSec = std::int64_t{36500} * 24 * 3600;

std::optional<std::int64_t> SecondsIn(std::string_view unit) {
  if (unit.empty() || unit == "s") {
    return 1;
  }
  if (unit == "m" || unit == "min") {
    return 60;
  }
  if (unit == "h") {
    return 3600;
  }
  return unit == "d" ? std::optional<std::int64_t>(24 * 3600) : std::nullopt;
}

}  // namespace

std::optional<std::int64_t> ParseLifetime(std::string_view text) {
  std::int64_t number = 0;
  const auto [end, error] = std::from_chars(text.data(), text.data() + text.size(), number);
  const auto unit = SecondsIn(text.substr(static_cast<std::size_t>(end - text.data())));
  if (error != std::errc() || !unit || number <= 0 || number > kLongestLifetimeSec / *unit) {
    return std::nullopt;
  }
  return number * *unit;
}

void AddLifetimeOption(CLI::App& command, std::int64_t& seconds) {
  seconds = ParseLifetime(kDefaultLifetime).value();
  command
      .add_option_function<std::string>(
          "--lifetime",
          [&seconds](const std::string& text) {
            const auto parsed = ParseLifetime(text);
            if (!parsed) {
              throw CLI::ValidationError("--lifetime",
                                         "it must be a duration such as 3600, 90s, 30m, 8h or 7d");
            }
            seconds = *parsed;
          },
          "How long the token is to be valid: seconds, or a number with s, m, h or d")
      ->type_name("DURATION")
      ->default_str(kDefaultLifetime);
}

void RequestOptions::AddTo(CLI::App& command) {
  AddLifetimeOption(command, lifetimeSec_);
  command
      .add_option("--audience", audiences_,
                  "A service that the token is to be restricted to, by its name; may be repeated")
      ->type_name("NAME")
      ->allow_extra_args(false);
  command.add_flag("--renewable", isRenewable_, "Ask for a token that can be renewed");
  command.add_flag("--delegable", isDelegable_, "Ask for a token that can be delegated");
  command.add_option("--delegate-to", delegateTo_, "Delegate the token to this principal")
      ->type_name("NAME");
  command
      .add_option("--act-as", actAsFile_,
                  "Ask for a token on behalf of the subject of the token in this file; - for "
                  "standard input")
      ->type_name("FILE");
}

void RequestOptions::AddConfirmationTo(CLI::App& command) {
  CLI::Option* const bearer = command.add_flag(
      "--bearer", isBearer_, "Ask for a token that is not bound to the key of --certificate");
  command
      .add_flag("--holder-of-key", isHolderOfKey_,
                "Ask for a token that is bound to the key of --certificate, as without an option")
      ->excludes(bearer);
}

TokenSpec RequestOptions::MakeSpec(bool mayBeOpen) const {
  TokenSpec spec;
  spec.tokenLifetimeSec = lifetimeSec_;
  spec.audienceRestriction.insert(audiences_.begin(), audiences_.end());
  spec.delegable = isDelegable_;
  spec.renewable = isRenewable_;
  spec.confirmation = isBearer_ ? CONFIRMATION_BEARER : CONFIRMATION_DEFAULT;
  if (!delegateTo_.empty()) {
    spec.delegateTo = delegateTo_;
  }
  if (!actAsFile_.empty()) {
    spec.actAsToken = ReadUnverifiedToken(ReadTokenFile(actAsFile_, mayBeOpen).Text());
  }
  return spec;
}

}  // namespace SsoClient::Tool
