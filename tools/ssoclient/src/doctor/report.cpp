#include "doctor/report.h"

#include <algorithm>
#include <utility>

namespace SsoClient::Tool::Doctor {
namespace {

const Step* FirstWith(const Report& report, StepOutcome outcome) noexcept {
  const auto found =
      std::find_if(report.steps.begin(), report.steps.end(),
                   [outcome](const Step& step) { return step.finding.outcome == outcome; });
  return found != report.steps.end() ? &*found : nullptr;
}

}  // namespace

const char* NameOf(StepOutcome outcome) noexcept {
  switch (outcome) {
    case StepOutcome::kOk:
      return "ok";
    case StepOutcome::kWarning:
      return "warning";
    case StepOutcome::kFailed:
      return "failed";
    case StepOutcome::kSkipped:
      return "skipped";
  }
  return "unknown";
}

Finding Fine(std::string message) {
  return {StepOutcome::kOk, ExitStatus::kDone, "ok", std::move(message), ""};
}

Finding Warning(ExitStatus status, FindingName name, std::string message, std::string remedy) {
  return {StepOutcome::kWarning, status, std::string(name.Text()), std::move(message),
          std::move(remedy)};
}

Finding Failure(ExitStatus status, FindingName name, std::string message, std::string remedy) {
  return {StepOutcome::kFailed, status, std::string(name.Text()), std::move(message),
          std::move(remedy)};
}

Finding Skipped(std::string message) {
  return {StepOutcome::kSkipped, ExitStatus::kDone, "skipped", std::move(message), ""};
}

Finding NotNeeded(std::string message) {
  return {StepOutcome::kSkipped, ExitStatus::kDone, "not-needed", std::move(message), ""};
}

const Step* FirstCause(const Report& report) noexcept {
  const Step* failed = FirstWith(report, StepOutcome::kFailed);
  return failed != nullptr ? failed : FirstWith(report, StepOutcome::kWarning);
}

ExitStatus StatusOf(const Report& report, bool isStrict) noexcept {
  const Step* cause = FirstCause(report);
  const bool counts =
      cause != nullptr && (isStrict || cause->finding.outcome == StepOutcome::kFailed);
  return counts ? cause->finding.status : ExitStatus::kDone;
}

}  // namespace SsoClient::Tool::Doctor
