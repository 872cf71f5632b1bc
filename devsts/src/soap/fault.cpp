#include "soap/fault.h"

#include "xml/namespaces.h"

namespace DevSts {

void ThrowInvalidRequest(const std::string& faultString) {
  throw Fault(kTrustNamespace, "InvalidRequest", faultString);
}

void ThrowFailedAuthentication(const std::string& faultString) {
  throw Fault(kTrustNamespace, "FailedAuthentication", faultString);
}

void ThrowRequestFailed(const std::string& faultString) {
  throw Fault(kTrustNamespace, "RequestFailed", faultString);
}

void ThrowInvalidTimeRange(const std::string& faultString) {
  throw Fault(kTrustNamespace, "InvalidTimeRange", faultString);
}

void ThrowUnableToRenew(const std::string& faultString) {
  throw Fault(kTrustNamespace, "UnableToRenew", faultString);
}

void ThrowInvalidSecurity(const std::string& faultString) {
  throw Fault(kWsseNamespace, "InvalidSecurity", faultString);
}

void ThrowInvalidSecurityToken(const std::string& faultString) {
  throw Fault(kWsseNamespace, "InvalidSecurityToken", faultString);
}

void ThrowUnsupportedAlgorithm(const std::string& faultString) {
  throw Fault(kWsseNamespace, "UnsupportedAlgorithm", faultString);
}

void ThrowFailedCheck(const std::string& faultString) {
  throw Fault(kWsseNamespace, "FailedCheck", faultString);
}

void ThrowMessageExpired(const std::string& faultString) {
  throw Fault(kWsuNamespace, "MessageExpired", faultString);
}

}  // namespace DevSts
