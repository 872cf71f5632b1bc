#include "transport/sso_connection_specs.h"

#include <gmock/gmock.h>
#include <tarnik/system/tcp_client_socket.h>

#include <chrono>
#include <future>

#include "transport/connect_recorder.h"
#include "transport/fake_ssl.h"
#include "transport/loopback_server.h"
#include "transport/spec_slots.h"

namespace SsoClient {
namespace {

class SsoCustomSslConnectionSpecImplTest : public testing::Test {
 protected:
  Tarnik::Ref<SsoCustomSslConnectionSpecImpl> MakeSpec(const std::string& host, int port,
                                                       bool flag = false) {
    return Tarnik::MakeRef<SsoCustomSslConnectionSpecImpl>(
        context_.get(), "sts.example",
        Tarnik::MakeRef<SsoCustomConnectionSpecImpl>(host, port, flag));
  }

  Tarnik::Ref<Testing::FakeSslContext> context_ = Tarnik::MakeRef<Testing::FakeSslContext>();
};

TEST_F(SsoCustomSslConnectionSpecImplTest, TellsAllAsItsInnerSpecDoes) {
  const auto inner = Tarnik::MakeRef<SsoCustomConnectionSpecImpl>("host", 443, true);
  const auto spec = Tarnik::MakeRef<SsoCustomSslConnectionSpecImpl>(context_.get(), "peer", inner);
  EXPECT_EQ(spec->ToString(), inner->ToString());
  EXPECT_EQ(spec->Host(), "host");
  EXPECT_EQ(spec->CookieHost(), "host");
  EXPECT_EQ(spec->EndpointKey(), "host:443");
  EXPECT_FALSE(spec->IsProxy());
}

TEST_F(SsoCustomSslConnectionSpecImplTest, AllSlotsStandInTheirOrder) {
  Testing::CheckSpecSlots([this](int port) {
    return new SsoCustomSslConnectionSpecImpl(
        context_.get(), "", Tarnik::MakeRef<SsoCustomConnectionSpecImpl>("127.0.0.1", port, false));
  });
}

TEST_F(SsoCustomSslConnectionSpecImplTest, HoldsOneReferenceToTheContext) {
  {
    const auto spec = MakeSpec("host", 1);
    EXPECT_EQ(context_->RefCount(), 2);
  }
  EXPECT_EQ(context_->RefCount(), 1);
}

TEST_F(SsoCustomSslConnectionSpecImplTest, RunsAHandshakeWithHostAndServerName) {
  Testing::LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 4), 0);
  for (const bool flag : {false, true}) {
    Testing::ConnectRecorder recorder;
    MakeSpec("127.0.0.1", listener.Port(), flag)->StartConnect(recorder.Completion());
    recorder.Wait();
    EXPECT_EQ(recorder.calls, 1);
    EXPECT_FALSE(recorder.hasError) << recorder.message;
    EXPECT_FALSE(recorder.isOnCallersThread);
    EXPECT_NE(dynamic_cast<Testing::FakeSslStream*>(recorder.lastStream.get()), nullptr);
    EXPECT_EQ(context_->label, "");
    EXPECT_EQ(context_->host, "127.0.0.1");
    EXPECT_EQ(context_->serverName, "sts.example");
    recorder.lastStream->Close();
  }
  EXPECT_EQ(context_->wraps, 2);
}

TEST_F(SsoCustomSslConnectionSpecImplTest, AFailedHandshakeComesWithItsStream) {
  Testing::LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  context_->handshakeFailure = "certificate has expired";
  Testing::ConnectRecorder recorder;
  MakeSpec("127.0.0.1", listener.Port())->StartConnect(recorder.Completion());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.hasError);
  EXPECT_EQ(recorder.message, "certificate has expired");
  ASSERT_NE(dynamic_cast<Testing::FakeSslStream*>(recorder.lastStream.get()), nullptr);
  recorder.lastStream->Close();
}

TEST_F(SsoCustomSslConnectionSpecImplTest, AHandshakeThatCannotBeginIsReportedOnce) {
  Testing::LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  context_->handshakeRefusal = "the server name is none";
  Testing::ConnectRecorder recorder;
  MakeSpec("127.0.0.1", listener.Port())->StartConnect(recorder.Completion());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.hasError);
  EXPECT_EQ(recorder.message, "the server name is none");
  ASSERT_NE(recorder.lastStream, nullptr);
  recorder.lastStream->Close();
}

TEST_F(SsoCustomSslConnectionSpecImplTest, AFailedConnectNeverStartsAHandshake) {
  const Testing::LoopbackSocket deaf;  // bound, but nobody listens: refused
  Testing::ConnectRecorder recorder;
  MakeSpec("127.0.0.1", deaf.Port())->StartConnect(recorder.Completion());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.hasError);
  EXPECT_EQ(recorder.message,
            "Cannot connect to 127.0.0.1:" + std::to_string(deaf.Port()) + ": Connection refused");
  EXPECT_NE(dynamic_cast<Tarnik::System::TCPClientSocket*>(recorder.lastStream.get()), nullptr);
  EXPECT_EQ(context_->wraps, 0);
}

TEST_F(SsoCustomSslConnectionSpecImplTest, CancellingClosesTheSocketAndStartsNoHandshake) {
  const Testing::FullListener listener;
  Testing::ConnectRecorder recorder;
  const auto item = MakeSpec("127.0.0.1", listener.Port())->StartConnect(recorder.Completion());
  EXPECT_TRUE(item->Cancel());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.isCancelled) << recorder.message;
  EXPECT_EQ(context_->wraps, 0);
}

TEST_F(SsoCustomSslConnectionSpecImplTest, TheBindingKeepsTheContextUntilTheCompletionHasRun) {
  Testing::LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  Testing::ConnectRecorder recorder;
  auto spec = MakeSpec("127.0.0.1", listener.Port());
  auto item = spec->StartConnect(recorder.Completion());
  spec = nullptr;
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_FALSE(recorder.hasError) << recorder.message;
  recorder.lastStream->Close();
}

using SsoCustomSslConnectionSpecImplDeathTest = SsoCustomSslConnectionSpecImplTest;

TEST_F(SsoCustomSslConnectionSpecImplDeathTest, AnEmptyCompletionFailsOnTheIoThread) {
  testing::GTEST_FLAG(death_test_style) = "threadsafe";
  EXPECT_DEATH(
      {
        const Testing::LoopbackSocket deaf;  // bound, but nobody listens: refused
        MakeSpec("127.0.0.1", deaf.Port())->StartConnect(nullptr);
        std::promise<void>().get_future().wait_for(std::chrono::seconds(20));
      },
      "bad_function_call");
}

}  // namespace
}  // namespace SsoClient
