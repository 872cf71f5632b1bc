#ifndef SSOCLIENT_TOOL_DOCTOR_RENDER_H
#define SSOCLIENT_TOOL_DOCTOR_RENDER_H

#include <nlohmann/json_fwd.hpp>

#include "doctor/report.h"
#include "output/console.h"

namespace SsoClient::Tool::Doctor {

/// Writes the steps to `console.out`, and the first cause with its remedy after them.
void PrintReport(const Console& console, const Report& report);

/// The members of the JSON object.
nlohmann::json ToJson(const Report& report);

}  // namespace SsoClient::Tool::Doctor

#endif
