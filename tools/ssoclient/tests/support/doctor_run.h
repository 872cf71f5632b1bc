#ifndef SSOCLIENT_TOOL_TESTS_SUPPORT_DOCTOR_RUN_H
#define SSOCLIENT_TOOL_TESTS_SUPPORT_DOCTOR_RUN_H

#include <memory>
#include <string>
#include <vector>

#include <nlohmann/json_fwd.hpp>

#include "support/run_tool.h"

namespace SsoClient::Tool::Testing {

/// A run of `ssoclient doctor --json`. Expects that docs/tool.md has each problem that is found, in
/// its step, and with the status of the program if it is the first cause.
class DoctorRun {
 public:
  /// Throws `std::runtime_error` when it prints no JSON.
  explicit DoctorRun(const ToolOptions& options);

  int Status() const { return status_; }
  /// Members of a step; empty when it has none of that name.
  std::string Outcome(const std::string& step) const { return Member(step, "outcome"); }
  std::string Finding(const std::string& step) const { return Member(step, "finding"); }
  std::string Message(const std::string& step) const { return Member(step, "message"); }
  std::string Remedy(const std::string& step) const { return Member(step, "remedy"); }
  /// A value of the step's details, by its JSON pointer, as JSON text.
  std::string Detail(const std::string& step, const std::string& pointer) const;
  double DurationMs(const std::string& step) const;
  /// The names of the steps, in order.
  std::vector<std::string> Steps() const;
  std::string FirstCause() const;
  /// All that was written.
  const std::string& Text() const { return text_; }

 private:
  void CompareWithPage(bool isStrict) const;
  const nlohmann::json& StepNamed(const std::string& step) const;
  std::string Member(const std::string& step, const char* name) const;

  std::shared_ptr<nlohmann::json> json_;
  std::string text_;
  int status_ = -1;
};

/// The environment of the tests, and these arguments after "doctor --json --url URL".
DoctorRun RunDoctor(const std::string& url, const std::vector<std::string>& arguments = {});

/// Expects that the step fails with the finding, that it is the first cause and has a remedy, that
/// the program ends with the status, and that `skipped`, if it is not empty, was skipped.
void ExpectFailure(const DoctorRun& run, const std::string& step, const std::string& finding,
                   int status, const std::string& skipped);

/// Expects that the step has this warning, with a remedy.
void ExpectWarning(const DoctorRun& run, const std::string& step, const std::string& finding);

}  // namespace SsoClient::Tool::Testing

#endif
