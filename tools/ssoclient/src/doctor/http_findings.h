#ifndef SSOCLIENT_TOOL_DOCTOR_HTTP_FINDINGS_H
#define SSOCLIENT_TOOL_DOCTOR_HTTP_FINDINGS_H

#include <string>

#include "doctor/examination.h"
#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// Whether the answer contains a SOAP envelope as far as its beginning shows, so that the service
/// itself has answered.
bool LooksLikeSoap(const HttpAnswer& answer);
/// Whether the answer is a page for people.
bool IsHtml(const HttpAnswer& answer);

/// What the answer means; `path` is the request target.
Finding FindingOfHttp(const HttpAnswer& answer, const std::string& path);

}  // namespace SsoClient::Tool::Doctor

#endif
