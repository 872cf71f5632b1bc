#include "support/doctor_run.h"

#include <algorithm>
#include <stdexcept>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

#include "support/finding_record.h"
#include "support/findings_page.h"

namespace SsoClient::Tool::Testing {

namespace {

bool Contains(const std::vector<std::string>& all, const std::string& one) {
  return std::find(all.begin(), all.end(), one) != all.end();
}

// The description of a finding of the step.
const DocumentedFinding& DescriptionOf(const std::string& finding, const std::string& step) {
  const std::vector<DocumentedFinding>& all = DocumentedFindings();
  const auto found = std::find_if(all.begin(), all.end(), [&](const DocumentedFinding& each) {
    return each.name == finding && (each.steps.contains(step) || each.steps.contains("any"));
  });
  if (found == all.end()) {
    throw std::runtime_error("docs/tool.md has no " + finding + " in the step " + step);
  }
  return *found;
}

void ExpectProblem(const DoctorRun& run, const std::string& step, const std::string& finding) {
  EXPECT_EQ(run.Finding(step), finding) << run.Message(step);
  EXPECT_NE(run.Message(step), "");
  EXPECT_NE(run.Remedy(step), "");
  RecordFinding(run.Finding(step));
}

}  // namespace

DoctorRun::DoctorRun(const ToolOptions& options) {
  const ToolResult result = RunTool(options);
  status_ = result.status;
  text_ = result.out + result.err;
  json_ = std::make_shared<nlohmann::json>(nlohmann::json::parse(result.out, nullptr, false));
  if (json_->is_discarded()) {
    throw std::runtime_error("not JSON: " + text_);
  }
  EXPECT_FALSE(json_->contains("error") && json_->contains("steps")) << text_;
  CompareWithPage(Contains(options.arguments, "--strict"));
}

void DoctorRun::CompareWithPage(bool isStrict) const {
  const std::string cause = FirstCause();
  for (const std::string& step : Steps()) {
    const std::string outcome = Outcome(step);
    if (outcome != "failed" && outcome != "warning") {
      continue;
    }
    const std::string finding = Finding(step);
    const DocumentedFinding& description = DescriptionOf(finding, step);
    EXPECT_TRUE(outcome == "failed" || description.mayBeWarning) << finding;
    if (finding == cause && (outcome == "failed" || isStrict)) {
      EXPECT_TRUE(description.statuses.contains(status_)) << finding << ": " << status_;
    }
  }
}

const nlohmann::json& DoctorRun::StepNamed(const std::string& step) const {
  for (const nlohmann::json& each : json_->at("steps")) {
    if (each.at("step") == step) {
      return each;
    }
  }
  throw std::runtime_error("there is no step " + step);
}

std::string DoctorRun::Member(const std::string& step, const char* name) const {
  return StepNamed(step).value(name, "");
}

std::string DoctorRun::Detail(const std::string& step, const std::string& pointer) const {
  return StepNamed(step).at("details").at(nlohmann::json::json_pointer(pointer)).dump();
}

double DoctorRun::DurationMs(const std::string& step) const {
  return StepNamed(step).at("durationMs");
}

std::vector<std::string> DoctorRun::Steps() const {
  std::vector<std::string> names;
  for (const nlohmann::json& each : json_->at("steps")) {
    names.push_back(each.at("step"));
  }
  return names;
}

std::string DoctorRun::FirstCause() const {
  return json_->contains("firstCause") ? json_->at("firstCause").at("finding") : "";
}

DoctorRun RunDoctor(const std::string& url, const std::vector<std::string>& arguments) {
  ToolOptions options;
  options.arguments = {"doctor", "--json", "--url", url};
  options.arguments.insert(options.arguments.end(), arguments.begin(), arguments.end());
  return DoctorRun(options);
}

void ExpectWarning(const DoctorRun& run, const std::string& step, const std::string& finding) {
  EXPECT_EQ(run.Outcome(step), "warning") << run.Text();
  ExpectProblem(run, step, finding);
}

void ExpectFailure(const DoctorRun& run, const std::string& step, const std::string& finding,
                   int status, const std::string& skipped) {
  EXPECT_EQ(run.Status(), status) << run.Text();
  EXPECT_EQ(run.Outcome(step), "failed");
  ExpectProblem(run, step, finding);
  EXPECT_EQ(run.FirstCause(), finding);
  if (!skipped.empty()) {
    EXPECT_EQ(run.Outcome(skipped), "skipped");
    EXPECT_EQ(run.Finding(skipped), "skipped");
  }
}

}  // namespace SsoClient::Tool::Testing
