// Calls of a process that may open no further descriptor, in a forked child.
#include <future>
#include <string>
#include <vector>

#include <gtest/gtest.h>
#include <sys/resource.h>
#include <unistd.h>

#include <ssoclient/ssoclient.h>
#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

#include "faults/sts_client.h"
#include "support/forked_child.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Testing::HoldsInChild;

/// During its lifetime this process can open only `spare` descriptors.
class DescriptorShortage {
 public:
  explicit DescriptorShortage(int spare = 0) {
    getrlimit(RLIMIT_NOFILE, &before_);
    std::vector<int> spares;
    for (int i = 0; i < spare; ++i) {
      spares.push_back(dup(STDERR_FILENO));
    }
    // The lowest descriptor that is free besides them.
    const int lowest = dup(STDERR_FILENO);
    close(lowest);
    for (const int descriptor : spares) {
      close(descriptor);
    }
    const rlimit shortage{static_cast<rlim_t>(lowest), before_.rlim_max};
    setrlimit(RLIMIT_NOFILE, &shortage);
  }
  ~DescriptorShortage() { setrlimit(RLIMIT_NOFILE, &before_); }
  DescriptorShortage(const DescriptorShortage&) = delete;
  DescriptorShortage& operator=(const DescriptorShortage&) = delete;

 private:
  rlimit before_{};
};

constexpr char kNoPool[] = "Cannot start the thread pool: Too many open files.";

template <class Failure, class Call>
std::string MessageOf(const Call& call) {
  const DescriptorShortage shortage;
  try {
    call();
    return "no failure";
  } catch (const Failure& failure) {
    return failure.Message();
  }
}

void StartThePool() {
  std::promise<void> done;
  Tarnik::System::GetThreadPool()->Run([&] { done.set_value(); });
  done.get_future().wait();
}

class DescriptorFaultsTest : public testing::Test {
 protected:
  void SetUp() override {
#ifdef __SANITIZE_ADDRESS__
    GTEST_SKIP() << "UndefinedBehaviorSanitizer needs descriptors to check an object's type";
#endif
  }
};

TEST_F(DescriptorFaultsTest, WithoutDescriptorsForThePoolACallFails) {
  const StsClient client = StsClient::WithTls();
  EXPECT_TRUE(HoldsInChild([&] {
    return MessageOf<Tarnik::ResourceException>([&] { client.Login(); }) == kNoPool &&
           client.Login() != nullptr;
  }));
}

TEST_F(DescriptorFaultsTest, WithDescriptorsForOneIoThreadACallSucceeds) {
  constexpr int kOfOneIoThread = 3;
  const StsClient client = StsClient::WithTls();
  EXPECT_TRUE(HoldsInChild([&] {
    const DescriptorShortage shortage(kOfOneIoThread + 1);
    return client.Login() != nullptr;
  }));
}

TEST_F(DescriptorFaultsTest, WithoutDescriptorsForThePoolAnAsyncCallIsRefused) {
  const StsClient client = StsClient::WithTls();
  EXPECT_TRUE(HoldsInChild([&] {
    return MessageOf<Tarnik::ResourceException>([&] {
             client.Service().AcquireTokenAsync(
                 kUser, kPassword, StsClient::Spec(),
                 [](const auto&, const Tarnik::Exception*) { Tarnik::Testing::EndChild(false); });
           }) == kNoPool &&
           client.Login() != nullptr;
  }));
}

TEST_F(DescriptorFaultsTest, WithoutADescriptorForItsSocketACallFails) {
  const StsClient client = StsClient::WithTls();
  EXPECT_TRUE(HoldsInChild([&] {
    StartThePool();
    const std::string message = MessageOf<CommunicationException>([&] { client.Login(); });
    return message.starts_with("Cannot connect to 127.0.0.1:") &&
           message.ends_with(": Too many open files") && client.Login() != nullptr;
  }));
}

}  // namespace
}  // namespace SsoClient::Testing
