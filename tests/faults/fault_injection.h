#ifndef SSOCLIENT_TESTS_FAULTS_FAULT_INJECTION_H
#define SSOCLIENT_TESTS_FAULTS_FAULT_INJECTION_H

#include <cstddef>

/// Makes one call of a kind fail: an allocation by operator new or by the library's own malloc,
/// which Expat's memory comes from, or a call of OpenSSL's that digests, verifies or signs. For one
/// thread at a time.
namespace SsoClient::Testing {

enum class FaultKind { kAllocation, kCrypto };

/// From its making to its end, the call of `kind` with this index (counted from 0) fails; one of
/// crypto gives `result`.
class InjectedFault {
 public:
  InjectedFault(FaultKind kind, std::size_t index, int result = 0) noexcept;
  ~InjectedFault();
  InjectedFault(const InjectedFault&) = delete;
  InjectedFault& operator=(const InjectedFault&) = delete;

  /// False when there were fewer calls.
  bool HasHappened() const noexcept;
};

}  // namespace SsoClient::Testing

#endif
