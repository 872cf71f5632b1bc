#ifndef SSOCLIENT_TOOL_DOCTOR_RUNNER_H
#define SSOCLIENT_TOOL_DOCTOR_RUNNER_H

#include "doctor/examination.h"
#include "doctor/report.h"
#include "output/console.h"

namespace SsoClient::Tool::Doctor {

/// Runs all steps, and shows on the terminal of `console` which one is under way. A step that
/// depends on one that failed is skipped.
Report Examine(const Plan& plan, const Console& console);

}  // namespace SsoClient::Tool::Doctor

#endif
