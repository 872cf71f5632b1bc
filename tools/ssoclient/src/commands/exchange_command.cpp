#include <memory>
#include <string>

#include <CLI/CLI.hpp>

#include <ssoclient/saml_token_factory.h>
#include <ssoclient/security_token_service.h>
#include <tarnik/system/date_time.h>

#include "commands/bound_token.h"
#include "commands/commands.h"
#include "commands/token_output.h"
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

class ExchangeCommand final : public Command {
 public:
  CLI::App* AddTo(CLI::App& program) override;
  Outcome Run(const Console& console) override;

 private:
  ServiceOptions service_;
  RequestOptions request_;
  KeyOptions key_;
  TokenOutput output_;
  std::string file_;
  bool mayBeOpen_ = false;
};

CLI::App* ExchangeCommand::AddTo(CLI::App& program) {
  CLI::App* const command = program.add_subcommand(
      "exchange",
      "Get another token for a token\n"
      "Asks the service for another token by a token that is bound to the key of --certificate: "
      "for other services (--audience), delegated to somebody (--delegate-to), or on behalf of "
      "somebody else (--act-as). The token to delegate or to act with must have been "
      "obtained with --delegable.");
  SetExample(*command,
             "ssoclient exchange --url https://sts.example.com/sts --certificate me.pem \\\n"
             "    --key me.key --sts-certificate sts.pem --act-as alice.xml \\\n"
             "    --output new.xml mine.xml");
  command->add_option("FILE", file_, "The token to exchange; - for standard input")->required();
  service_.AddConnectionTo(*command);
  service_.AddSignersTo(*command);
  key_.AddTo(*command, true);
  request_.AddTo(*command);
  request_.AddConfirmationTo(*command);
  output_.AddTo(*command,
                "Write the new token to this file, which only its owner can read; without it or "
                "with -, to standard output, unless that is a terminal");
  AddOpenFilesOption(*command, mayBeOpen_);
  AddJsonOption(*command);
  return command;
}

Token Exchange(const Console& console, const ServiceSetup& setup, const Token& own,
               const TokenSpec& spec) {
  try {
    return RunCall<Token>(console, setup, [own, spec](const auto& service) {
      return service.AcquireTokenByToken(*own, spec);
    });
  } catch (const ToolException& exception) {
    RethrowWithRemedy(exception, spec, own.get());
  }
}

Outcome ExchangeCommand::Run(const Console& console) {
  CheckStandardInput({{"FILE", IsStandardStream(file_)}, request_.ActAsInput()},
                     {key_.PassphraseInput()});
  output_.SetDefault("-");
  output_.Check(WantsJson());
  ServiceSetup setup = service_.MakeSetup();
  setup.remedyOfRefusal = kRemedyOfRefusedToken;
  const auto signers = service_.Signers();
  setup.tokenFactory = CreateSamlTokenFactory(signers.get());
  setup.holderOfKey = key_.Load(mayBeOpen_);
  const Token own = ReadBoundToken(file_, mayBeOpen_, *signers, *setup.holderOfKey);
  const TokenSpec spec = request_.MakeSpec(mayBeOpen_);
  const Token token = Exchange(console, setup, own, spec);
  const auto deviations = FindDeviations(*token, spec, request_.WantsBearer(), GetUtcDateTime());
  return output_.Deliver(console, *token, deviations, WantsJson());
}

}  // namespace

std::unique_ptr<Command> MakeExchangeCommand() {
  return std::make_unique<ExchangeCommand>();
}

}  // namespace SsoClient::Tool
