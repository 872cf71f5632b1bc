#include "commands/token_output.h"

#include <memory>
#include <ostream>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <tarnik/system/date_time.h>

#include "failure.h"
#include "input/token_file.h"
#include "output/duration_text.h"
#include "output/safe_text.h"
#include "token/confirmation_name.h"
#include "token/token_json.h"
#include "token/token_rows.h"
#include "token/validity.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::System::DateTime;

void PrintForPeople(std::ostream& stream, const Console& console, const SamlToken& token,
                    const std::vector<Deviation>& deviations, const DateTime& now) {
  const Validity validity{token.StartTime(), token.ExpirationTime(), now};
  stream << SafeText(console, PrincipalText(token.Subject())) << ": "
         << ConfirmationName(token.ConfirmationType()) << " token, " << validity.ToString()
         << ", until " << TimeText(validity.end) << '\n';
  for (const Deviation& each : deviations) {
    stream << "  note: " << each.field << ": asked for " << SafeText(console, each.requested)
           << ", issued " << SafeText(console, each.issued) << '\n';
  }
}

nlohmann::json DeviationsJson(const std::vector<Deviation>& deviations) {
  nlohmann::json json = nlohmann::json::array();
  for (const Deviation& each : deviations) {
    json.push_back({{"field", each.field}, {"requested", each.requested}, {"issued", each.issued}});
  }
  return json;
}

}  // namespace

void TokenOutput::AddTo(CLI::App& command, const std::string& description) {
  command.add_option("-o,--output", path_, description)->type_name("FILE");
}

void TokenOutput::SetDefault(const std::string& path) {
  if (path_.empty()) {
    path_ = path;
  }
}

void TokenOutput::Check(bool wantsJson) const {
  if (wantsJson && IsStandardStream(path_)) {
    throw ToolException({ExitStatus::kUsage, "output-json",
                         "standard output cannot be the token and the JSON object",
                         "name a file for the token with --output"});
  }
  CheckTokenFile(path_);
}

Outcome TokenOutput::Deliver(const Console& console, const SamlToken& token,
                             const std::vector<Deviation>& deviations, bool wantsJson) const {
  WriteTokenFile(path_, token.Xml());
  const DateTime now = Tarnik::System::GetUtcDateTime();
  if (wantsJson) {
    auto json = std::make_shared<nlohmann::json>();
    (*json)["output"] = path_;
    (*json)["token"] = TokenJson(token, now);
    (*json)["deviations"] = DeviationsJson(deviations);
    return {ExitStatus::kDone, json};
  }
  const bool isOutput = IsStandardStream(path_);
  std::ostream& stream = isOutput ? console.err : console.out;
  PrintForPeople(stream, console, token, deviations, now);
  if (!isOutput) {
    stream << "written to " << SafeText(console, path_) << '\n';
  }
  return {};
}

}  // namespace SsoClient::Tool
