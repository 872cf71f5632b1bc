#include <cstdint>
#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include <ssoclient/saml_token_factory.h>
#include <ssoclient/security_token_service.h>
#include <tarnik/system/date_time.h>

#include "commands/bound_token.h"
#include "commands/commands.h"
#include "commands/token_output.h"
#include "failure.h"
#include "input/private_file.h"
#include "input/standard_input.h"
#include "input/token_file.h"
#include "options/key_options.h"
#include "options/request_options.h"
#include "options/service_options.h"
#include "service/service_call.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::System::GetUtcDateTime;
using Token = std::shared_ptr<const SamlToken>;

class RenewCommand final : public Command {
 public:
  CLI::App* AddTo(CLI::App& program) override;
  Outcome Run(const Console& console) override;

 private:
  ServiceOptions service_;
  KeyOptions key_;
  TokenOutput output_;
  std::string file_;
  std::int64_t lifetimeSec_ = 0;
  bool mayBeOpen_ = false;
};

CLI::App* RenewCommand::AddTo(CLI::App& program) {
  CLI::App* const command = program.add_subcommand(
      "renew",
      "Renew a token, in its file or another one\n"
      "Asks the service for the token with a new lifetime from now. The token must be renewable "
      "and bound to the key of --certificate. Readers of the file see the old or the new token, "
      "and if anything fails, the old one remains.");
  SetExample(*command,
             "ssoclient renew --url https://sts.example.com/sts --sts-certificate sts.pem \\\n"
             "    --certificate me.pem --key me.key --lifetime 8h token.xml");
  command->add_option("FILE", file_, "The token; - for standard input")->required();
  service_.AddConnectionTo(*command);
  service_.AddSignersTo(*command);
  key_.AddTo(*command, true);
  AddLifetimeOption(*command, lifetimeSec_);
  output_.AddTo(*command,
                "Write the new token to this file, which only its owner can read; without it, to "
                "FILE; - for standard output, unless that is a terminal");
  AddOpenFilesOption(*command, mayBeOpen_);
  AddJsonOption(*command);
  return command;
}

// What was asked for, by the token that was renewed.
TokenSpec SpecOf(const SamlToken& token, std::int64_t lifetimeSec) {
  TokenSpec spec;
  spec.tokenLifetimeSec = lifetimeSec;
  token.GetAudiences(spec.audienceRestriction);
  spec.renewable = token.IsRenewable();
  spec.delegable = token.IsDelegable();
  return spec;
}

// A service refuses in words of its own.
Token Renew(const Console& console, const ServiceSetup& setup, const Token& token,
            std::int64_t lifetimeSec) {
  try {
    return RunCall<Token>(console, setup, [token, lifetimeSec](const auto& service) {
      return service.RenewToken(*token, lifetimeSec);
    });
  } catch (const ToolException& exception) {
    Failure failure = exception.GetFailure();
    if (failure.status == ExitStatus::kRefused && !token->IsRenewable()) {
      failure.remedy = "the token is not renewable: log in with --renewable";
    }
    throw ToolException(failure);
  }
}

Outcome RenewCommand::Run(const Console& console) {
  CheckStandardInput({{"FILE", IsStandardStream(file_)}}, {key_.PassphraseInput()});
  output_.SetDefault(file_);
  output_.Check(WantsJson());
  ServiceSetup setup = service_.MakeSetup();
  setup.remedyOfRefusal = kRemedyOfRefusedToken;
  const auto signers = service_.Signers();
  setup.tokenFactory = CreateSamlTokenFactory(signers.get());
  setup.holderOfKey = key_.Load(mayBeOpen_);
  const Token token = ReadBoundToken(file_, mayBeOpen_, *signers, *setup.holderOfKey);
  const Token renewed = Renew(console, setup, token, lifetimeSec_);
  const auto deviations =
      FindDeviations(*renewed, SpecOf(*token, lifetimeSec_), false, GetUtcDateTime());
  return output_.Deliver(console, *renewed, deviations, WantsJson());
}

}  // namespace

std::unique_ptr<Command> MakeRenewCommand() {
  return std::make_unique<RenewCommand>();
}

}  // namespace SsoClient::Tool
