#ifndef SSOCLIENT_TOOL_DOCTOR_HARMLESS_REQUEST_H
#define SSOCLIENT_TOOL_DOCTOR_HARMLESS_REQUEST_H

#include <string>

#include <tarnik/system/date_time.h>

#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// The action of the request.
inline constexpr const char* kHarmlessAction =
    "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate";

/// A request that no service can count as a failed login: it asks for the validity of a token
/// (WS-Trust 1.3, section 7) without containing one, names no user and has no credentials. An STS
/// answers with a fault.
std::string HarmlessRequest(const Tarnik::System::DateTime& now);

/// What the body of the answer to that request says about the service.
Finding FindingOfSoapAnswer(const std::string& body);

}  // namespace SsoClient::Tool::Doctor

#endif
