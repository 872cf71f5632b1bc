#include <nlohmann/json.hpp>

#include "doctor/render.h"

namespace SsoClient::Tool::Doctor {
namespace {

using Json = nlohmann::json;

Json ToJson(const Step& step) {
  const Finding& finding = step.finding;
  Json json = {{"step", step.name},
               {"outcome", NameOf(finding.outcome)},
               {"durationMs", static_cast<double>(step.duration.count()) / 1000},
               {"finding", finding.name},
               {"message", finding.message},
               {"details", step.details}};
  if (!finding.remedy.empty()) {
    json["remedy"] = finding.remedy;
  }
  return json;
}

}  // namespace

Json ToJson(const Report& report) {
  Json json = {{"url", report.url}, {"steps", Json::array()}};
  for (const Step& step : report.steps) {
    json["steps"].push_back(ToJson(step));
  }
  if (const Step* cause = FirstCause(report)) {
    json["firstCause"] = {{"step", cause->name},
                          {"finding", cause->finding.name},
                          {"message", cause->finding.message},
                          {"remedy", cause->finding.remedy}};
  }
  return json;
}

}  // namespace SsoClient::Tool::Doctor
