#include "options/request_options.h"

#include <CLI/CLI.hpp>

#include "input/token_file.h"
#include "options/duration_checks.h"
#include "output/duration_text.h"
#include "token/unverified_token.h"

namespace SsoClient::Tool {
namespace {

constexpr const char* kDefaultLifetime = "1h";

}  // namespace

void AddLifetimeOption(CLI::App& command, std::int64_t& seconds) {
  seconds = ParseDuration(kDefaultLifetime).value().count();
  command
      .add_option_function<std::string>(
          "--lifetime",
          [&seconds](const std::string& text) { seconds = ParseDuration(text).value().count(); },
          "How long the token is to be valid, such as 90s, 30m, 8h or 7d")
      ->check(CheckPositiveDuration)
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
      .add_option(
          "--act-as", actAsFile_,
          "Ask for a token on behalf of the subject of the token in this file, which must be "
          "delegable; - for standard input")
      ->type_name("FILE");
}

void RequestOptions::AddConfirmationTo(CLI::App& command) {
  CLI::Option* const bearer = command.add_flag(
      "--bearer", isBearer_, "Ask for a token that is not bound to the key of --certificate");
  command
      .add_flag("--holder-of-key", isHolderOfKey_,
                "Ask for a token that is bound to the key of --certificate (the default)")
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

void RethrowWithRemedy(const ToolException& exception, const TokenSpec& spec,
                       const SamlToken* own) {
  Failure failure = exception.GetFailure();
  const bool isRefused = failure.status == ExitStatus::kRefused;
  if (isRefused && spec.actAsToken && !(*spec.actAsToken)->IsDelegable()) {
    failure.remedy =
        "the token of --act-as is not delegable: its owner has to log in with --delegable";
  } else if (isRefused && own != nullptr && !own->IsDelegable() &&
             (spec.delegable || spec.delegateTo)) {
    failure.remedy = "the token is not delegable: log in with --delegable";
  }
  throw ToolException(failure);
}

}  // namespace SsoClient::Tool
