#ifndef SSOCLIENT_ACCESS_TESTS_FAULTS_FAILING_ALLOCATION_H
#define SSOCLIENT_ACCESS_TESTS_FAULTS_FAILING_ALLOCATION_H

#include <cstddef>

namespace SsoClient::Access::Testing {

/// During its lifetime the allocation by operator new with this index (counted from 0) fails, on
/// any thread. One at a time.
class FailingAllocation {
 public:
  explicit FailingAllocation(std::size_t index) noexcept;
  ~FailingAllocation();
  FailingAllocation(const FailingAllocation&) = delete;
  FailingAllocation& operator=(const FailingAllocation&) = delete;

  /// False if there were fewer allocations.
  bool HasHappened() const noexcept;
};

}  // namespace SsoClient::Access::Testing

#endif
