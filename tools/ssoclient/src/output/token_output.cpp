#include "output/token_output.h"

#include <algorithm>
#include <chrono>
#include <ostream>
#include <set>

#include <CLI/CLI.hpp>
#include <nlohmann/json.hpp>

#include <tarnik/system/date_time.h>

#include "failure.h"
#include "input/token_file.h"
#include "output/duration_text.h"
#include "output/safe_text.h"
#include "token/token_json.h"
#include "token/token_rows.h"
#include "token/validity.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::System::DateTime;

constexpr const char* kStandardOutput = "-";

bool IsAbout(std::chrono::seconds lifetime, std::chrono::seconds asked) {
  return std::chrono::abs(lifetime - asked) <= asked / 100 + std::chrono::seconds(2);
}

const char* YesOrNo(bool value) {
  return value ? "yes" : "no";
}

const char* ConfirmationText(bool isBearer) {
  return isBearer ? "bearer" : "holder-of-key";
}

std::string ListText(const std::set<std::string>& names) {
  std::string text;
  for (const std::string& each : names) {
    text += (text.empty() ? "" : ", ") + each;
  }
  return text.empty() ? "any" : text;
}

void PrintForPeople(std::ostream& stream, const Console& console, const SamlToken& token,
                    const std::vector<Deviation>& deviations, const DateTime& now) {
  const Validity validity{token.StartTime(), token.ExpirationTime(), now};
  stream << SafeText(console, PrincipalText(token.Subject())) << ": "
         << ConfirmationText(token.ConfirmationType() == BEARER) << " token, "
         << validity.ToString() << ", until " << TimeText(validity.end) << '\n';
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

std::vector<Deviation> FindDeviations(const SamlToken& token, const TokenSpec& spec, bool isBearer,
                                      const DateTime& now) {
  std::vector<Deviation> found;
  const auto compare = [&found](const char* field, bool isSame, const std::string& requested,
                                const std::string& issued) {
    if (!isSame) {
      found.push_back({field, requested, issued});
    }
  };
  const std::chrono::seconds asked(spec.tokenLifetimeSec);
  const auto period = SecondsBetween(token.StartTime(), token.ExpirationTime());
  const auto rest = SecondsBetween(now, token.ExpirationTime());
  compare("lifetime", IsAbout(period, asked) || IsAbout(rest, asked), DurationText(asked),
          DurationText(std::min(period, rest)));
  compare("renewable", token.IsRenewable() == spec.renewable, YesOrNo(spec.renewable),
          YesOrNo(token.IsRenewable()));
  compare("delegable", token.IsDelegable() == spec.delegable, YesOrNo(spec.delegable),
          YesOrNo(token.IsDelegable()));
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  compare("audiences", audiences == spec.audienceRestriction, ListText(spec.audienceRestriction),
          ListText(audiences));
  const bool isIssuedBearer = token.ConfirmationType() == BEARER;
  compare("confirmation", isIssuedBearer == isBearer, ConfirmationText(isBearer),
          ConfirmationText(isIssuedBearer));
  return found;
}

void TokenOutput::AddTo(CLI::App& command, const std::string& description) {
  command.add_option("-o,--output", path_, description)->type_name("FILE");
}

void TokenOutput::SetDefault(const std::string& path) {
  if (path_.empty()) {
    path_ = path;
  }
}

void TokenOutput::Check(bool wantsJson) const {
  if (wantsJson && path_ == kStandardOutput) {
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
  const bool isOutput = path_ == kStandardOutput;
  std::ostream& stream = isOutput ? console.err : console.out;
  PrintForPeople(stream, console, token, deviations, now);
  if (!isOutput) {
    stream << "written to " << SafeText(console, path_) << '\n';
  }
  return {};
}

}  // namespace SsoClient::Tool
