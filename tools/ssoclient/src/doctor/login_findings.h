#ifndef SSOCLIENT_TOOL_DOCTOR_LOGIN_FINDINGS_H
#define SSOCLIENT_TOOL_DOCTOR_LOGIN_FINDINGS_H

#include <exception>
#include <string>
#include <vector>

#include "doctor/login_parts.h"
#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// What a failed login means. `signers` are those that the refused token names, `trusted` the
/// subjects of --sts-certificate; `isKerberos` says that the client's side of the negotiation
/// failed.
Finding JudgeLoginFailure(const std::exception& failure, const std::vector<ClaimedSigner>& signers,
                          const std::string& trusted, bool isKerberos);

}  // namespace SsoClient::Tool::Doctor

#endif
