// Threads of the pool that cannot be started. Each test begins without threads, in a forked child.
#include <future>
#include <string>
#include <thread>
#include <typeinfo>

#include <gtest/gtest.h>

#include <devsts/server.h>
#include <ssoclient/ssoclient.h>
#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

#include "faults/fault_injection.h"
#include "faults/sts_client.h"
#include "support/forked_child.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::GetThreadPool;
using Tarnik::Testing::HoldsInChild;

constexpr char kNoThread[] = "Cannot start a thread: Resource temporarily unavailable.";

// The threads of a child in the order in which they start.
constexpr std::size_t kFirstIoThread = 0;
constexpr std::size_t kSecondIoThread = 1;
constexpr std::size_t kNextThread = 2;

bool RunsAnItem() {
  std::promise<void> done;
  GetThreadPool()->Run([&] { done.set_value(); });
  done.get_future().wait();
  return true;
}

template <class Start>
bool ThrowsNoThread(const Start& start) {
  try {
    start();
    return false;
  } catch (const Tarnik::ResourceException& failure) {
    return failure.Message() == kNoThread;
  }
}

TEST(StartOfThreadsFaultsTest, WithoutAnIoThreadTheStartOfThePoolIsRefused) {
  EXPECT_TRUE(HoldsInChild([] {
    const InjectedFault fault(FaultKind::kThreadStart, kFirstIoThread);
    return ThrowsNoThread([] { GetThreadPool()->Post([] {}); }) && fault.HasHappened() &&
           RunsAnItem();
  }));
}

TEST(StartOfThreadsFaultsTest, OneIoThreadIsEnough) {
  const StsClient client = StsClient::WithTls();
  EXPECT_TRUE(HoldsInChild([&] {
    const InjectedFault fault(FaultKind::kThreadStart, kSecondIoThread);
    return RunsAnItem() && fault.HasHappened() && client.Login() != nullptr;
  }));
}

// Different threads begin their connections on different I/O threads, if there are several.
TEST(StartOfThreadsFaultsTest, OneIoThreadIsEnoughForCallsOfAllThreads) {
  const StsClient client = StsClient::WithTls();
  EXPECT_TRUE(HoldsInChild([&] {
    const InjectedFault fault(FaultKind::kThreadStart, kSecondIoThread);
    int tokens = RunsAnItem() && fault.HasHappened() ? 0 : -1;
    for (int i = 0; i < 2; ++i) {
      std::thread([&] { tokens += client.Login() != nullptr ? 1 : 0; }).join();
    }
    return tokens == 2;
  }));
}

TEST(StartOfThreadsFaultsTest, WithoutAWorkerAnItemIsRefused) {
  EXPECT_TRUE(HoldsInChild([] {
    const InjectedFault fault(FaultKind::kThreadStart, kNextThread);
    return ThrowsNoThread([] { GetThreadPool()->Run([] {}); }) && fault.HasHappened() &&
           RunsAnItem();
  }));
}

TEST(StartOfThreadsFaultsTest, WithoutAWorkerTheCallbackOfACallReceivesTheFailure) {
  const StsClient client = StsClient::WithTls();
  EXPECT_TRUE(HoldsInChild([&] {
    const InjectedFault fault(FaultKind::kThreadStart, kNextThread);
    std::promise<std::string> reported;
    client.Service().AcquireTokenAsync(
        kUser, kPassword, StsClient::Spec(),
        [&](const auto& token, const Tarnik::Exception* error) {
          reported.set_value(token == nullptr && error != nullptr &&
                                     typeid(*error) == typeid(Tarnik::ResourceException)
                                 ? error->Message()
                                 : "");
        });
    return reported.get_future().get() == kNoThread && fault.HasHappened();
  }));
}

TEST(StartOfThreadsFaultsTest, WithoutALookUpThreadACallFails) {
  const StsClient client = StsClient::WithTls("localhost");
  EXPECT_TRUE(HoldsInChild([&] {
    const InjectedFault fault(FaultKind::kThreadStart, kNextThread);
    try {
      client.Login();
      return false;
    } catch (const CommunicationException& failure) {
      return failure.Message().find("the thread for the host look-up cannot start") !=
                 std::string::npos &&
             fault.HasHappened();
    }
  }));
}

}  // namespace
}  // namespace SsoClient::Testing
