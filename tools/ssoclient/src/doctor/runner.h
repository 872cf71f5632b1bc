#ifndef SSOCLIENT_TOOL_DOCTOR_RUNNER_H
#define SSOCLIENT_TOOL_DOCTOR_RUNNER_H

#include <functional>
#include <string>

#include "doctor/examination.h"
#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// Is told each step before it begins.
using Progress = std::function<void(const std::string& step)>;

/// Runs all steps. A step that depends on one that failed is skipped.
Report Examine(const Plan& plan, const Progress& progress);

}  // namespace SsoClient::Tool::Doctor

#endif
