#ifndef SSOCLIENT_TESTS_FAULT_INJECTION_H
#define SSOCLIENT_TESTS_FAULT_INJECTION_H

#include <cstddef>

/// Makes one call of a kind fail: an allocation by operator new or by the library's own malloc,
/// which Expat's memory comes from, or a call of OpenSSL's that digests, verifies or signs. For one
/// thread at a time.
namespace FaultInjection {

enum class Kind { kAllocation, kCrypto };

/// From its making to its end, the call of `kind` with this index (counted from 0) fails; one of
/// crypto gives `result`.
class Fault {
 public:
  Fault(Kind kind, std::size_t index, int result = 0) noexcept;
  ~Fault();
  Fault(const Fault&) = delete;
  Fault& operator=(const Fault&) = delete;

  /// False when there were fewer calls.
  bool HasHappened() const noexcept;
};

}  // namespace FaultInjection

#endif
