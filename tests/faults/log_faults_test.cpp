// Allocations that fail in the log lines of an operation.
#include <cstddef>
#include <new>

#include <gtest/gtest.h>

#include <ssoclient/ssoclient.h>
#include <tarnik/core/exception.h>

#include "faults/fault_injection.h"
#include "faults/sts_client.h"

namespace SsoClient::Testing {
namespace {

// Without a key, the operation is refused. Its last line is written while the failure is on its way
// to the caller.
TEST(LogFaultsTest, EachAllocationOfAnOperationThatIsRefusedMayFail) {
  const StsClient client = StsClient::WithoutTls();
  int refusals = 0;
  int shortages = 0;
  bool hasHappened = true;
  for (std::size_t index = 0; hasHappened; ++index) {
    const InjectedFault fault(FaultKind::kAllocation, index);
    try {
      client.Service().AcquireTokenByCertificate(StsClient::Spec());
    } catch (const Tarnik::InvalidStateException&) {
      ++refusals;
    } catch (const std::bad_alloc&) {
      ++shortages;
    }
    hasHappened = fault.HasHappened();
  }
  EXPECT_GT(refusals, 1);
  EXPECT_GT(shortages, 0);
}

}  // namespace
}  // namespace SsoClient::Testing
