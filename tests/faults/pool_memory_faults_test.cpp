// Single allocations that fail on the threads of the pool, anywhere in an exchange.
#include <atomic>
#include <cstddef>
#include <future>
#include <limits>
#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/ssoclient.h>
#include <tarnik/core/exception.h>

#include "faults/fault_injection.h"
#include "faults/sts_client.h"

namespace SsoClient::Testing {
namespace {

/// How many calls ended in which way while one allocation after the other failed.
struct Tally {
  std::size_t points = 0;
  std::size_t tokens = 0;
  std::size_t failures = 0;
};

constexpr std::size_t kAll = std::numeric_limits<std::size_t>::max();

/// Calls `login` with each of the first `end` allocations of `kind` failing, or only with every
/// `stride`-th. A login either succeeds or fails with an exception of the platform; the next one
/// succeeds.
template <class Login>
Tally FailEachAllocation(const StsClient& client, FaultKind kind, std::size_t stride,
                         const Login& login, std::size_t end = kAll) {
  Tally tally;
  for (std::size_t index = 0; index < end; index += stride) {
    bool hasHappened = false;
    {
      const InjectedFault fault(kind, index);
      try {
        tally.tokens += login(client) != nullptr ? 1 : 0;
      } catch (const Tarnik::Exception&) {
        ++tally.failures;
      }
      hasHappened = fault.HasHappened();
    }
    if (!hasHappened) {
      return tally;
    }
    ++tally.points;
    EXPECT_NE(client.Login(), nullptr) << "after the failure of allocation " << index;
  }
  return tally;
}

std::shared_ptr<const SamlToken> LogIn(const StsClient& client) {
  return client.Login();
}

std::shared_ptr<const SamlToken> LogInAsynchronously(const StsClient& client) {
  std::promise<std::shared_ptr<const SamlToken>> issued;
  std::atomic<int> callbacks{0};
  client.Service().AcquireTokenAsync(kUser, kPassword, StsClient::Spec(),
                                     [&](const auto& token, const Tarnik::Exception* error) {
                                       ++callbacks;
                                       if (error == nullptr) {
                                         issued.set_value(token);
                                         return;
                                       }
                                       try {
                                         error->Throw();
                                       } catch (const Tarnik::Exception&) {
                                         issued.set_exception(std::current_exception());
                                       }
                                     });
  const auto future = issued.get_future().share();
  future.wait();
  EXPECT_EQ(callbacks, 1);
  return future.get();
}

TEST(PoolMemoryFaultsTest, EachAllocationOnAnIoThreadMayFail) {
  const StsClient client = StsClient::WithoutTls();
  const Tally tally = FailEachAllocation(client, FaultKind::kIoThreadAllocation, 1, LogIn);
  EXPECT_GT(tally.points, 10U);
  EXPECT_GT(tally.failures, 5U);
  RecordProperty("points", static_cast<int>(tally.points));
}

TEST(PoolMemoryFaultsTest, EachAllocationOnAnIoThreadMayFailWithTls) {
  const StsClient client = StsClient::WithTls();
  const Tally tally = FailEachAllocation(client, FaultKind::kIoThreadAllocation, 7, LogIn);
  EXPECT_GT(tally.points, 50U);
  EXPECT_GT(tally.failures, 20U);
  RecordProperty("points", static_cast<int>(tally.points));
}

// The object of a connection is made and connected to its callbacks first.
TEST(PoolMemoryFaultsTest, EachAllocationOfTheSetUpOfTlsMayFail) {
  const StsClient client = StsClient::WithTls();
  constexpr std::size_t kSetUp = 100;
  const Tally tally = FailEachAllocation(client, FaultKind::kIoThreadAllocation, 1, LogIn, kSetUp);
  EXPECT_EQ(tally.points, kSetUp);
  EXPECT_GT(tally.failures, kSetUp / 2);
}

TEST(PoolMemoryFaultsTest, EachAllocationOnAWorkerMayFail) {
  const StsClient client = StsClient::WithoutTls();
  const Tally tally =
      FailEachAllocation(client, FaultKind::kWorkerAllocation, 3, LogInAsynchronously);
  EXPECT_GT(tally.points, 50U);
  EXPECT_GT(tally.failures, 50U);
  RecordProperty("points", static_cast<int>(tally.points));
}

}  // namespace
}  // namespace SsoClient::Testing
