#include <ostream>
#include <string>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <tarnik/system/date_time.h>

#include "commands/commands.h"
#include "input/private_file.h"
#include "input/token_file.h"
#include "output/table.h"
#include "token/token_json.h"
#include "token/token_rows.h"
#include "token/unverified_token.h"

namespace SsoClient::Tool {
namespace {

class ShowCommand final : public Command {
 public:
  CLI::App* AddTo(CLI::App& program) override;
  Outcome Run(const Console& console) override;

 private:
  std::string file_;
  bool mayBeOpen_ = false;
};

CLI::App* ShowCommand::AddTo(CLI::App& program) {
  CLI::App* const command = program.add_subcommand(
      "show",
      "Show what a token says, and how long it is valid\n"
      "Prints whom the token is about, for whom it is, whose key it is bound to, who has signed "
      "it and where in its validity it is now, but neither its text nor its signature. The "
      "signature is not verified, so anyone can have written the token: use 'ssoclient verify' "
      "before you believe it.");
  SetExample(*command, "ssoclient show token.xml");
  command->add_option("FILE", file_, "The token; - for standard input")->required();
  AddOpenFilesOption(*command, mayBeOpen_);
  AddJsonOption(*command);
  return command;
}

Outcome ShowCommand::Run(const Console& console) {
  const auto token = ReadUnverifiedToken(ReadTokenFile(file_, mayBeOpen_).Text());
  const Tarnik::System::DateTime now = Tarnik::System::GetUtcDateTime();
  if (WantsJson()) {
    auto json = std::make_shared<nlohmann::json>(TokenJson(*token, now));
    (*json)["isVerified"] = false;
    return {ExitStatus::kDone, json};
  }
  Table table("");
  AddTokenRows(console, *token, now, table);
  table.Print(console);
  console.out << console.Paint(Colour::kWarning, "not verified: use 'ssoclient verify'") << '\n';
  return {};
}

}  // namespace

std::unique_ptr<Command> MakeShowCommand() {
  return std::make_unique<ShowCommand>();
}

}  // namespace SsoClient::Tool
