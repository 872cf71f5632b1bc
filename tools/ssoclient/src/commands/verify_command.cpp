#include <string>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include "commands/commands.h"
#include "input/private_file.h"
#include "input/token_file.h"
#include "options/gate_options.h"
#include "options/presenter_options.h"
#include "token/verdict_output.h"

namespace SsoClient::Tool {
namespace {

class VerifyCommand final : public Command {
 public:
  CLI::App* AddTo(CLI::App& program) override;
  Outcome Run(const Console& console) override;

 private:
  GateOptions gate_;
  PresenterOptions presenter_;
  std::string file_;
  bool mayBeOpen_ = false;
};

CLI::App* VerifyCommand::AddTo(CLI::App& program) {
  CLI::App* const command = program.add_subcommand(
      "verify",
      "Check a token as a server does, and print each check\n"
      "Ends with status 0 if the token is accepted, with 1 if it is refused, and with 4 if the "
      "certificates cannot be read. The service that issued the token is not asked: "
      "'ssoclient validate' does that.");
  SetExample(*command,
             "ssoclient verify --sts-certificate sts.pem --tls-certificate caller.pem \\\n"
             "    --audience https://orders.example.com token.xml");
  command->add_option("FILE", file_, "The token; - for standard input")->required();
  gate_.AddTo(*command);
  presenter_.AddTo(*command);
  AddOpenFilesOption(*command, mayBeOpen_);
  AddJsonOption(*command);
  return command;
}

Outcome VerifyCommand::Run(const Console& console) {
  const Tarnik::System::DateTime time = gate_.CheckTime();
  const auto gate = gate_.MakeGate(time);
  const Access::Presenter presenter = presenter_.MakePresenter();
  const Access::Verdict verdict = gate->Check(ReadTokenFile(file_, mayBeOpen_).Text(), presenter);
  Outcome outcome;
  outcome.status = verdict.IsAccepted() ? ExitStatus::kDone : ExitStatus::kRefused;
  if (WantsJson()) {
    outcome.json = std::make_shared<nlohmann::json>(VerdictJson(verdict, time));
  } else {
    PrintVerdict(console, verdict, time, gate_.HasOwnTime());
  }
  return outcome;
}

}  // namespace

std::unique_ptr<Command> MakeVerifyCommand() {
  return std::make_unique<VerifyCommand>();
}

}  // namespace SsoClient::Tool
