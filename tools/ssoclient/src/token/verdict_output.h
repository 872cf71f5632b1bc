#ifndef SSOCLIENT_TOOL_TOKEN_VERDICT_OUTPUT_H
#define SSOCLIENT_TOOL_TOKEN_VERDICT_OUTPUT_H

#include <string>

#include <nlohmann/json.hpp>

#include <ssoclient/access/verdict.h>
#include <tarnik/system/date_time.h>

#include "output/console.h"

namespace SsoClient::Tool {

/// "new-token", "access" or "service"; "none" for an accepted token.
const char* NameOf(Access::Remedy remedy) noexcept;

/// What can be done about a refusal and by whom, for people; empty for `Reason::kNone`.
std::string RemedyText(Access::Reason reason);

/// The option of 'ssoclient verify' to look at after this refusal; empty if no option applies.
std::string OptionHint(Access::Reason reason);

/// The members of docs/tool.md: the decision, and a record of each check.
nlohmann::json VerdictJson(const Access::Verdict& verdict, const Tarnik::System::DateTime& time);

/// Writes the ledger as a table with a mark for each check, and then the decision.
void PrintVerdict(const Console& console, const Access::Verdict& verdict,
                  const Tarnik::System::DateTime& time, bool hasOwnTime);

}  // namespace SsoClient::Tool

#endif
