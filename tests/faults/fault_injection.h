#ifndef SSOCLIENT_TESTS_FAULTS_FAULT_INJECTION_H
#define SSOCLIENT_TESTS_FAULTS_FAULT_INJECTION_H

#include <cstddef>

/// Makes one call of a kind fail: an allocation by operator new or by the library's calls of
/// malloc, which provide Expat's memory, an allocation within OpenSSL, an OpenSSL call that
/// digests, verifies or signs, or the start of a thread. One fault at a time; the call may be on
/// any thread.
namespace SsoClient::Testing {

enum class FaultKind {
  kAllocation,
  kOpenSslAllocation,
  kCrypto,
  /// An allocation, OpenSSL's included, on an I/O thread of the pool.
  kIoThreadAllocation,
  /// The same on a worker of the pool.
  kWorkerAllocation,
  /// The same on a thread with the name `kCallerThreadName`.
  kCallerAllocation,
  /// The start of a thread.
  kThreadStart,
};

inline constexpr char kCallerThreadName[] = "test-caller";

/// During its lifetime the call of `kind` with this index (counted from 0) fails; a crypto call
/// returns `result`.
class InjectedFault {
 public:
  InjectedFault(FaultKind kind, std::size_t index, int result = 0) noexcept;
  ~InjectedFault();
  InjectedFault(const InjectedFault&) = delete;
  InjectedFault& operator=(const InjectedFault&) = delete;

  /// False if there were fewer calls.
  bool HasHappened() const noexcept;
  /// Lets all further calls succeed, for code that cannot reach the object.
  static void Disarm() noexcept;
};

/// During its lifetime every allocation fails, on all threads, also within OpenSSL.
class MemoryShortage {
 public:
  MemoryShortage() noexcept;
  ~MemoryShortage();
  MemoryShortage(const MemoryShortage&) = delete;
  MemoryShortage& operator=(const MemoryShortage&) = delete;
};

}  // namespace SsoClient::Testing

#endif
