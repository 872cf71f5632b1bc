#ifndef DEVSTS_SOAP_FAULT_H
#define DEVSTS_SOAP_FAULT_H

#include <memory>
#include <stdexcept>
#include <string>
#include <utility>

#include "devsts/misbehavior.h"

namespace DevSts {

// Thrown to answer a request with a SOAP fault.
class Fault : public std::runtime_error {
 public:
  Fault(const char* codeNamespace, const char* codeName, const std::string& faultString)
      : Fault(FaultAnswer{codeNamespace, codeName, faultString}) {}
  explicit Fault(FaultAnswer answer)
      : std::runtime_error(answer.faultString),
        answer_(std::make_shared<const FaultAnswer>(std::move(answer))) {}

  const FaultAnswer& Answer() const { return *answer_; }

 private:
  // Shared, because copying an exception must not fail.
  std::shared_ptr<const FaultAnswer> answer_;
};

// The faults of WS-Trust 1.3, section 11.
[[noreturn]] void ThrowInvalidRequest(const std::string& faultString);
[[noreturn]] void ThrowFailedAuthentication(const std::string& faultString);
[[noreturn]] void ThrowRequestFailed(const std::string& faultString);
[[noreturn]] void ThrowInvalidTimeRange(const std::string& faultString);
[[noreturn]] void ThrowUnableToRenew(const std::string& faultString);
// The faults of WS-Security 1.1, section 12.
[[noreturn]] void ThrowInvalidSecurity(const std::string& faultString);
[[noreturn]] void ThrowInvalidSecurityToken(const std::string& faultString);
[[noreturn]] void ThrowUnsupportedAlgorithm(const std::string& faultString);
[[noreturn]] void ThrowFailedCheck(const std::string& faultString);
[[noreturn]] void ThrowMessageExpired(const std::string& faultString);

}  // namespace DevSts

#endif
