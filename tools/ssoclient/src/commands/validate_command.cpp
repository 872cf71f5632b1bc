#include <memory>
#include <ostream>
#include <string>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <ssoclient/saml_token_factory.h>
#include <ssoclient/security_token_service.h>
#include <tarnik/system/date_time.h>

#include "commands/commands.h"
#include "input/private_file.h"
#include "input/token_file.h"
#include "options/service_options.h"
#include "output/safe_text.h"
#include "service/service_call.h"
#include "token/token_json.h"
#include "token/token_rows.h"
#include "token/unverified_token.h"
#include "token/validity.h"

namespace SsoClient::Tool {
namespace {

class ValidateCommand final : public Command {
 public:
  CLI::App* AddTo(CLI::App& program) override;
  Outcome Run(const Console& console) override;

 private:
  Outcome Report(const Console& console, const SamlToken& token, bool isValid) const;

  ServiceOptions service_;
  std::string file_;
  bool mayBeOpen_ = false;
};

CLI::App* ValidateCommand::AddTo(CLI::App& program) {
  CLI::App* const command = program.add_subcommand(
      "validate",
      "Ask the service whether a token is valid\n"
      "Prints 'valid' and ends with status 0, or prints 'invalid' and ends with status 1. The "
      "service decides: 'ssoclient verify' checks a token without it.");
  SetExample(*command, "ssoclient validate --url https://sts.example.com/sts token.xml");
  command->add_option("FILE", file_, "The token; - for standard input")->required();
  service_.AddConnectionTo(*command);
  AddOpenFilesOption(*command, mayBeOpen_);
  AddJsonOption(*command);
  return command;
}

Outcome ValidateCommand::Report(const Console& console, const SamlToken& token,
                                bool isValid) const {
  const ExitStatus status = isValid ? ExitStatus::kDone : ExitStatus::kRefused;
  const auto now = Tarnik::System::GetUtcDateTime();
  if (WantsJson()) {
    auto json = std::make_shared<nlohmann::json>();
    (*json)["isValid"] = isValid;
    (*json)["token"] = TokenJson(token, now);
    return {status, json};
  }
  if (!isValid) {
    console.out << console.Paint(Colour::kBad, "invalid") << '\n';
    return {status, nullptr};
  }
  const Validity validity{token.StartTime(), token.ExpirationTime(), now};
  console.out << console.Paint(Colour::kGood, "valid") << ": "
              << SafeText(console, PrincipalText(token.Subject())) << ", " << validity.ToString()
              << '\n';
  return {status, nullptr};
}

Outcome ValidateCommand::Run(const Console& console) {
  const auto token = ReadUnverifiedToken(ReadTokenFile(file_, mayBeOpen_).Text());
  ServiceSetup setup = service_.MakeSetup();
  // No token is issued, so the factory is not used.
  setup.tokenFactory = CreateSamlTokenFactory(nullptr);
  const bool isValid = RunCall<bool>(
      console, setup, [token](const auto& service) { return service.ValidateSubject(*token); });
  return Report(console, *token, isValid);
}

}  // namespace

std::unique_ptr<Command> MakeValidateCommand() {
  return std::make_unique<ValidateCommand>();
}

}  // namespace SsoClient::Tool
