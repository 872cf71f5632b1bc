#ifndef DEVSTS_FAULT_H
#define DEVSTS_FAULT_H

#include <stdexcept>
#include <string>

#include "devsts/misbehavior.h"

namespace DevSts {

// Ends the work on a request with a SOAP fault.
class Fault : public std::runtime_error {
 public:
  Fault(const char* codeNamespace, const char* codeName, const std::string& faultString)
      : std::runtime_error(faultString), codeNamespace_(codeNamespace), codeName_(codeName) {}

  FaultAnswer Answer() const {
    FaultAnswer answer;
    answer.codeNamespace = codeNamespace_;
    answer.codeName = codeName_;
    answer.faultString = what();
    return answer;
  }

 private:
  const char* codeNamespace_;
  const char* codeName_;
};

// WS-Trust 1.3, section 11.
[[noreturn]] void ThrowInvalidRequest(const std::string& faultString);
[[noreturn]] void ThrowFailedAuthentication(const std::string& faultString);
[[noreturn]] void ThrowInvalidTimeRange(const std::string& faultString);
[[noreturn]] void ThrowUnableToRenew(const std::string& faultString);
// WS-Security 1.1, section 12.
[[noreturn]] void ThrowInvalidSecurity(const std::string& faultString);
[[noreturn]] void ThrowInvalidSecurityToken(const std::string& faultString);
[[noreturn]] void ThrowUnsupportedAlgorithm(const std::string& faultString);
[[noreturn]] void ThrowFailedCheck(const std::string& faultString);
[[noreturn]] void ThrowMessageExpired(const std::string& faultString);

}  // namespace DevSts

#endif
