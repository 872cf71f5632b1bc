#ifndef SSOCLIENT_TOOL_DOCTOR_TOKEN_FINDINGS_H
#define SSOCLIENT_TOOL_DOCTOR_TOKEN_FINDINGS_H

#include <tarnik/system/date_time.h>

#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// Whether a token of this validity can be used at `now` by a service that tolerates nothing.
Finding FindingOfValidity(const Tarnik::System::DateTime& start,
                          const Tarnik::System::DateTime& end, const Tarnik::System::DateTime& now);

}  // namespace SsoClient::Tool::Doctor

#endif
