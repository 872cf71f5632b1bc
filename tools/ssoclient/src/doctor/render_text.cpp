#include <array>
#include <cstdio>
#include <ostream>

#include "doctor/render.h"
#include "output/safe_text.h"
#include "output/text_width.h"

namespace SsoClient::Tool::Doctor {
namespace {

Colour ColourOf(StepOutcome outcome) {
  switch (outcome) {
    case StepOutcome::kOk:
      return Colour::kGood;
    case StepOutcome::kWarning:
      return Colour::kWarning;
    case StepOutcome::kFailed:
      return Colour::kBad;
    case StepOutcome::kSkipped:
      break;
  }
  return Colour::kFaint;
}

std::string DurationText(const Step& step) {
  if (step.finding.outcome == StepOutcome::kSkipped) {
    return std::string(9, ' ');
  }
  std::array<char, 32> text{};
  std::snprintf(text.data(), text.size(), "%6.0f ms",
                static_cast<double>(step.duration.count()) / 1000);
  return text.data();
}

void PrintStep(const Console& console, const Step& step) {
  const Finding& finding = step.finding;
  const bool isProblem =
      finding.outcome == StepOutcome::kFailed || finding.outcome == StepOutcome::kWarning;
  console.out << console.Paint(ColourOf(finding.outcome), PaddedTo(NameOf(finding.outcome), 8))
              << PaddedTo(step.name, 12) << DurationText(step) << "  "
              << (isProblem ? finding.name + ": " : "") << SafeText(console, finding.message)
              << '\n';
  for (const std::string& line : step.lines) {
    console.out << std::string(10, ' ') << console.Paint(Colour::kFaint, SafeText(console, line))
                << '\n';
  }
  if (!finding.remedy.empty()) {
    console.out << std::string(8, ' ') << "remedy: " << SafeText(console, finding.remedy) << '\n';
  }
}

}  // namespace

void PrintReport(const Console& console, const Report& report) {
  console.out << console.Paint(Colour::kStrong, SafeText(console, report.url)) << '\n';
  for (const Step& step : report.steps) {
    PrintStep(console, step);
  }
  const Step* cause = FirstCause(report);
  console.out << '\n';
  if (cause == nullptr) {
    console.out << console.Paint(Colour::kGood, "all is well") << '\n';
    return;
  }
  const bool isFailure = cause->finding.outcome == StepOutcome::kFailed;
  console.out << console.Paint(ColourOf(cause->finding.outcome),
                               isFailure ? "first cause: " : "no failure; first warning: ")
              << SafeText(console, cause->finding.message) << '\n';
  console.out << "remedy: " << SafeText(console, cause->finding.remedy) << '\n';
}

}  // namespace SsoClient::Tool::Doctor
