#ifndef SSOCLIENT_TOOL_DOCTOR_REPORT_H
#define SSOCLIENT_TOOL_DOCTOR_REPORT_H

#include <chrono>
#include <string>
#include <vector>

#include <nlohmann/json.hpp>

#include "doctor/finding_name.h"
#include "exit_status.h"

namespace SsoClient::Tool::Doctor {

enum class StepOutcome {
  kOk,
  kWarning,  ///< logins work, but something needs attention
  kFailed,
  kSkipped,
};

/// The name in lower case, such as "failed"; valid for the lifetime of the process.
const char* NameOf(StepOutcome outcome) noexcept;

/// What a step has found.
struct Finding {
  StepOutcome outcome = StepOutcome::kOk;
  /// The status of the program if this is the first cause.
  ExitStatus status = ExitStatus::kDone;
  /// For programs: "ok", "skipped" when a step before it failed, "not-needed", or one of
  /// `kFindingNames`.
  std::string name = "ok";
  std::string message{};  ///< one line for people
  std::string remedy{};   ///< what the user can do; empty without a problem
};

Finding Fine(std::string message);
Finding Warning(ExitStatus status, FindingName name, std::string message, std::string remedy);
Finding Failure(ExitStatus status, FindingName name, std::string message, std::string remedy);
/// A step that could not run.
Finding Skipped(std::string message);
/// A step that does not apply; the steps after it run.
Finding NotNeeded(std::string message);

struct Step {
  std::string name{};  ///< such as "dns"
  Finding finding{};
  std::chrono::microseconds duration{0};
  /// What people want to know besides, such as the certificates of a chain; one line each.
  std::vector<std::string> lines{};
  /// The same for programs.
  nlohmann::json details = nlohmann::json::object();
};

struct Report {
  std::string url{};
  std::vector<Step> steps{};
};

/// The first step that failed, or the first one with a warning; null when all is well.
const Step* FirstCause(const Report& report) noexcept;
/// The status of the first cause. Warnings count only if `isStrict`.
ExitStatus StatusOf(const Report& report, bool isStrict) noexcept;

}  // namespace SsoClient::Tool::Doctor

#endif
