#include "options/gate_options.h"

#include <chrono>
#include <cstdlib>

#include <CLI/CLI.hpp>

#include <tarnik/core/exception.h>

#include "failure.h"
#include "input/decimal_text.h"
#include "options/duration_checks.h"
#include "output/duration_text.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::System::DateTime;

constexpr const char* kTrustVariable = "SSOCLIENT_STS_CERTIFICATE";

std::string CheckTimeText(const std::string& text) {
  try {
    DateTime::Parse(text);
    return {};
  } catch (const Tarnik::Exception&) {
    return "'" + text + "' is not a time such as 2026-11-22T16:30:00Z";
  }
}

std::string CheckCount(const std::string& text) {
  constexpr std::size_t kMostDigits = 15;
  return IsDecimal(text, kMostDigits) ? std::string() : "'" + text + "' is not a whole number";
}

std::string CheckPositiveCount(const std::string& text) {
  const bool isZero = text.find_first_not_of('0') == std::string::npos;
  const std::string fault = CheckCount(text);
  return fault.empty() && isZero ? "it must not be 0" : fault;
}

// "DOMAIN\name", as groups are written in tokens, or "name@DOMAIN".
PrincipalId ParseGroup(const std::string& text) {
  if (const std::size_t slash = text.find('\\'); slash != std::string::npos) {
    return {text.substr(slash + 1), text.substr(0, slash)};
  }
  if (const std::size_t at = text.rfind('@'); at != std::string::npos) {
    return {text.substr(0, at), text.substr(at + 1)};
  }
  return {text, ""};
}

std::string CheckGroup(const std::string& text) {
  const PrincipalId group = ParseGroup(text);
  return group.name.empty() || group.domain.empty()
             ? "'" + text + "' is not a group such as 'EXAMPLE\\staff'"
             : std::string();
}

// An option whose values are collected, one each time that it is given: otherwise it would also
// take the arguments after its value.
CLI::Option* AddRepeated(CLI::App& command, const std::string& name,
                         std::vector<std::string>& values, const std::string& text) {
  return command.add_option(name, values, text + ". May be repeated")->allow_extra_args(false);
}

}  // namespace

void GateOptions::AddTo(CLI::App& command) {
  AddTrustTo(command);
  AddPolicyTo(command);
  AddLimitsTo(command);
}

void GateOptions::AddTrustTo(CLI::App& command) {
  AddRepeated(command, "--sts-certificate", trustPaths_,
              "Certificates that the service signs tokens with: a file in PEM or DER, or a "
              "folder of them. Without --issuer they may sign in the name of every issuer. "
              "Without this option and --trust-for, the file is that of the variable " +
                  std::string(kTrustVariable))
      ->type_name("PATH")
      ->group("Trust");
  command
      .add_option("--issuer", issuer_,
                  "Trust the certificates of --sts-certificate for this issuer only")
      ->type_name("NAME")
      ->group("Trust");
  command
      .add_option("--trust-for", pathsOfIssuers_,
                  "Certificates that may sign for this issuer only. May be repeated")
      ->type_name("ISSUER PATH")
      ->allow_extra_args(false)
      ->group("Trust");
  CLI::Option* const lists =
      AddRepeated(command, "--crl", listPaths_,
                  "Revocation lists; each signer must then be covered by a current one")
          ->type_name("PATH")
          ->group("Trust");
  AddRepeated(command, "--list-signer", listSignerPaths_,
              "Certificates of the authorities that sign the lists")
      ->type_name("PATH")
      ->needs(lists)
      ->group("Trust");
}

void GateOptions::AddPolicyTo(CLI::App& command) {
  AddRepeated(command, "--audience", audiences_, "A name by which tokens are meant for the service")
      ->type_name("NAME")
      ->required()
      ->group("Policy");
  command
      .add_flag("--accept-unrestricted", acceptsUnrestricted_,
                "Accept tokens that are not restricted to audiences, too")
      ->group("Policy");
  command.add_option("--bearer", bearer_, "Whether bearer tokens are accepted")
      ->type_name("accept|refuse")
      ->capture_default_str()
      ->check([](const std::string& text) {
        return text == "accept" || text == "refuse" ? std::string()
                                                    : "'" + text + "' is not accept or refuse";
      })
      ->group("Policy");
  AddRepeated(command, "--group", groups_,
              "A group of which the subject must be a member, such as 'EXAMPLE\\staff'; of "
              "several, one")
      ->type_name("GROUP")
      ->check(CheckGroup)
      ->group("Policy");
}

void GateOptions::AddLimitsTo(CLI::App& command) {
  command
      .add_option("--clock-tolerance", clockTolerance_,
                  "By how much clocks may differ, such as 90s or 5m")
      ->type_name("DURATION")
      ->capture_default_str()
      ->check(CheckDuration)
      ->group("Limit");
  command
      .add_option("--longest-lifetime", longestLifetime_,
                  "How long a token may be valid from its start to its end")
      ->type_name("DURATION")
      ->capture_default_str()
      ->check(CheckPositiveDuration)
      ->group("Limit");
  command
      .add_option("--deepest-delegation", deepestDelegation_, "How many delegates a token may have")
      ->type_name("NUMBER")
      ->capture_default_str()
      ->check(CheckCount)
      ->group("Limit");
  command
      .add_option("--largest-token", largestToken_, "How long the text of a token may be, in bytes")
      ->type_name("BYTES")
      ->capture_default_str()
      ->check(CheckPositiveCount)
      ->group("Limit");
  command
      .add_option("--at", time_,
                  "Check as if it were this time, such as 2026-11-22T16:30:00Z; certificates and "
                  "revocation lists are still the current ones")
      ->type_name("DATETIME")
      ->check(CheckTimeText)
      ->group("Limit");
}

// The variable never adds to what --trust-for restricts.
std::vector<std::string> GateOptions::TrustPaths() const {
  const char* const variable = std::getenv(kTrustVariable);
  const bool isVariable = trustPaths_.empty() && pathsOfIssuers_.empty() && variable != nullptr;
  return isVariable && *variable != '\0' ? std::vector<std::string>{variable} : trustPaths_;
}

std::vector<Access::TrustedIssuer> GateOptions::Issuers() const {
  std::vector<Access::TrustedIssuer> issuers;
  const std::vector<std::string> paths = TrustPaths();
  if (paths.empty() && !issuer_.empty()) {
    throw ToolException({ExitStatus::kUsage, "no-trust", "--issuer is for --sts-certificate",
                         "use --trust-for, or --sts-certificate"});
  }
  if (!paths.empty()) {
    Access::TrustedIssuer& entry = issuers.emplace_back();
    entry.issuer = issuer_;
    entry.isForAnyIssuer = issuer_.empty();
    entry.certificatePaths = paths;
  }
  for (const auto& [issuer, path] : pathsOfIssuers_) {
    Access::TrustedIssuer& entry = issuers.emplace_back();
    entry.issuer = issuer;
    entry.certificatePaths = {path};
  }
  for (Access::TrustedIssuer& entry : issuers) {
    entry.revocationListPaths = listPaths_;
    entry.listSignerPaths = listSignerPaths_;
  }
  return issuers;
}

std::shared_ptr<Access::TrustStore> GateOptions::MakeTrust() const {
  Access::TrustStoreConfig config;
  config.issuers = Issuers();
  config.isWatching = false;
  if (config.issuers.empty()) {
    throw ToolException(
        {ExitStatus::kUsage, "no-trust", "there is nobody who may sign tokens",
         "name the certificate of the service's signing key with --sts-certificate"});
  }
  try {
    return Access::CreateTrustStore(std::move(config));
  } catch (const Tarnik::Exception& exception) {
    throw ToolException(
        {ExitStatus::kLocal, "trust-files", exception.what(),
         "check the files of --sts-certificate, --trust-for, --crl and --list-signer"});
  }
}

DateTime GateOptions::CheckTime() const {
  return time_.empty() ? Tarnik::System::GetUtcDateTime() : DateTime::Parse(time_);
}

std::shared_ptr<Access::TokenGate> GateOptions::MakeGate(const DateTime& time) const {
  Access::GateConfig config;
  config.trust = MakeTrust();
  config.audiences = audiences_;
  config.acceptsUnrestrictedTokens = acceptsUnrestricted_;
  config.bearerTokens =
      bearer_ == "accept" ? Access::BearerTokens::kAccept : Access::BearerTokens::kRefuse;
  config.clockTolerance = ParseDuration(clockTolerance_).value();
  config.longestLifetime = ParseDuration(longestLifetime_).value();
  config.deepestDelegation = deepestDelegation_;
  for (const std::string& group : groups_) {
    config.allowedGroups.push_back(ParseGroup(group));
  }
  config.largestToken = largestToken_;
  config.cache.tokens = 0;
  config.clock = [time] { return time; };
  return CreateTokenGate(std::move(config));
}

}  // namespace SsoClient::Tool
