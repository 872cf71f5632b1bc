#include "support/doctor_run.h"

#include <stdexcept>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

namespace SsoClient::Tool::Testing {

DoctorRun::DoctorRun(const ToolOptions& options) {
  const ToolResult result = RunTool(options);
  status_ = result.status;
  text_ = result.out + result.err;
  json_ = std::make_shared<nlohmann::json>(result.Json());
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

void ExpectFailure(const DoctorRun& run, const std::string& step, const std::string& finding,
                   int status, const std::string& skipped) {
  EXPECT_EQ(run.Status(), status) << run.Text();
  EXPECT_EQ(run.Outcome(step), "failed");
  EXPECT_EQ(run.Finding(step), finding) << run.Message(step);
  EXPECT_NE(run.Message(step), "");
  EXPECT_NE(run.Remedy(step), "");
  EXPECT_EQ(run.FirstCause(), finding);
  if (!skipped.empty()) {
    EXPECT_EQ(run.Outcome(skipped), "skipped");
    EXPECT_EQ(run.Finding(skipped), "skipped");
  }
}

}  // namespace SsoClient::Tool::Testing
