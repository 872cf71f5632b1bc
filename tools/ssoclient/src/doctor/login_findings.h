#ifndef SSOCLIENT_TOOL_DOCTOR_LOGIN_FINDINGS_H
#define SSOCLIENT_TOOL_DOCTOR_LOGIN_FINDINGS_H

#include <exception>
#include <string>
#include <string_view>
#include <vector>

#include "doctor/login_parts.h"
#include "doctor/report.h"

namespace SsoClient::Tool::Doctor {

/// What a login has shown besides its failure.
struct LoginFacts {
  /// Those that the refused token names.
  std::vector<ClaimedSigner> signers{};
  std::string trusted{};      ///< the subjects of --sts-certificate
  std::string_view secret{};  ///< the password, which must not be in a finding; empty for none
  bool isKerberos = false;    ///< the client's side of the negotiation failed
};

/// What a failed login means.
Finding FindingOfLoginFailure(const std::exception& failure, const LoginFacts& facts);

}  // namespace SsoClient::Tool::Doctor

#endif
