#include "transport/sso_connection_specs.h"

#include <chrono>
#include <future>
#include <sstream>
#include <string>

#include <gmock/gmock.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/system/tcp_client_socket.h>

#include "transport/connect_recorder.h"
#include "transport/fake_ssl.h"
#include "transport/loopback_server.h"
#include "transport/spec_slots.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Http::ConnectionSpec;
using Tarnik::Http::CustomConnectionSpec;

Tarnik::Ref<SsoCustomConnectionSpecImpl> MakePlainSpec(const std::string& host, int port,
                                                       bool flag = false) {
  return Tarnik::MakeRef<SsoCustomConnectionSpecImpl>(host, port, flag);
}

TEST(SsoCustomConnectionSpecImplTest, ReturnsTheConfiguredEndpoint) {
  for (const bool flag : {false, true}) {
    const auto spec = MakePlainSpec("sts.example", 443, flag);
    EXPECT_EQ(spec->Host(), "sts.example");
    EXPECT_EQ(spec->CookieHost(), "sts.example");
    EXPECT_EQ(spec->EndpointKey(), "sts.example:443");
    EXPECT_FALSE(spec->IsProxy());
    EXPECT_EQ(spec->ChooseHost(), "sts.example");
  }
}

TEST(SsoCustomConnectionSpecImplTest, KeysHaveNoBrackets) {
  EXPECT_EQ(MakePlainSpec("::1", 8443)->EndpointKey(), "::1:8443");
  EXPECT_EQ(MakePlainSpec("%1%2", 1)->EndpointKey(), "%1%2:1");
}

TEST(SsoCustomConnectionSpecImplTest, DescribesItselfByAddressAndEndpoint) {
  const auto spec = MakePlainSpec("sts.example", 443);
  std::ostringstream address;
  address << static_cast<const void*>(spec.get());
  EXPECT_EQ(spec->ToString(),
            "<cs p:" + address.str() + ", SsoCustomConnectionSpec:sts.example:443>");
}

TEST(SsoCustomConnectionSpecImplTest, KeepsItsSlotOrder) {
  CheckSpecSlots(
      [](int port) { return new SsoCustomConnectionSpecImpl("127.0.0.1", port, false); });
}

TEST(SsoCustomConnectionSpecImplTest, ConnectsWithAndWithoutTheFlag) {
  LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 4), 0);
  for (const bool flag : {false, true}) {
    ConnectRecorder recorder;
    const auto item =
        MakePlainSpec("127.0.0.1", listener.Port(), flag)->StartConnect(recorder.Completion());
    EXPECT_NE(item, nullptr);
    recorder.Wait();
    EXPECT_EQ(recorder.calls, 1);
    EXPECT_FALSE(recorder.hasError) << recorder.message;
    EXPECT_FALSE(recorder.isOnCallersThread);
    ASSERT_NE(recorder.lastStream, nullptr);
    recorder.lastStream->Close();
  }
}

TEST(SsoCustomConnectionSpecImplTest, ServesConcurrentConnects) {
  LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 4), 0);
  const auto spec = MakePlainSpec("127.0.0.1", listener.Port());
  ConnectRecorder first;
  ConnectRecorder second;
  spec->StartConnect(first.Completion());
  spec->StartConnect(second.Completion());
  first.Wait();
  second.Wait();
  ASSERT_FALSE(first.hasError) << first.message;
  ASSERT_FALSE(second.hasError) << second.message;
  EXPECT_NE(first.lastStream, second.lastStream);
  first.lastStream->Close();
  second.lastStream->Close();
}

TEST(SsoCustomConnectionSpecImplTest, ReportsAFailedConnectOnce) {
  const LoopbackSocket notListening;  // so connects are refused
  ConnectRecorder recorder;
  MakePlainSpec("127.0.0.1", notListening.Port())->StartConnect(recorder.Completion());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.hasError);
  EXPECT_FALSE(recorder.isOnCallersThread);
  EXPECT_EQ(recorder.message, "Cannot connect to 127.0.0.1:" + std::to_string(notListening.Port()) +
                                  ": Connection refused");
}

TEST(SsoCustomConnectionSpecImplTest, CancellingClosesTheSocket) {
  const FullListener listener;
  ConnectRecorder recorder;
  const auto item =
      MakePlainSpec("127.0.0.1", listener.Port())->StartConnect(recorder.Completion());
  EXPECT_TRUE(item->Cancel());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.isCancelled) << recorder.message;
  EXPECT_TRUE(item->Cancel());
}

TEST(SsoCustomConnectionSpecImplTest, AnEmptyCompletionIsAllowed) {
  LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  const auto item = MakePlainSpec("127.0.0.1", listener.Port())->StartConnect(nullptr);
  ASSERT_NE(item, nullptr);
  const int accepted = ::accept(listener.Descriptor(), nullptr, nullptr);
  EXPECT_GE(accepted, 0);
  ::close(accepted);
  EXPECT_TRUE(item->Cancel());
}

class SsoCustomSslConnectionSpecImplTest : public testing::Test {
 protected:
  Tarnik::Ref<SsoCustomSslConnectionSpecImpl> MakeSpec(const std::string& host, int port,
                                                       bool flag = false) {
    return Tarnik::MakeRef<SsoCustomSslConnectionSpecImpl>(
        context_.get(), "sts.example",
        Tarnik::MakeRef<SsoCustomConnectionSpecImpl>(host, port, flag));
  }

  Tarnik::Ref<FakeSslContext> context_ = Tarnik::MakeRef<FakeSslContext>();
};

TEST_F(SsoCustomSslConnectionSpecImplTest, DescribesItselfAsItsInnerSpecDoes) {
  const auto inner = Tarnik::MakeRef<SsoCustomConnectionSpecImpl>("host", 443, true);
  const auto spec = Tarnik::MakeRef<SsoCustomSslConnectionSpecImpl>(context_.get(), "peer", inner);
  EXPECT_EQ(spec->ToString(), inner->ToString());
  EXPECT_EQ(spec->Host(), "host");
  EXPECT_EQ(spec->CookieHost(), "host");
  EXPECT_EQ(spec->EndpointKey(), "host:443");
  EXPECT_FALSE(spec->IsProxy());
}

TEST_F(SsoCustomSslConnectionSpecImplTest, KeepsItsSlotOrder) {
  CheckSpecSlots([this](int port) {
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
  LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 4), 0);
  for (const bool flag : {false, true}) {
    ConnectRecorder recorder;
    MakeSpec("127.0.0.1", listener.Port(), flag)->StartConnect(recorder.Completion());
    recorder.Wait();
    EXPECT_EQ(recorder.calls, 1);
    EXPECT_FALSE(recorder.hasError) << recorder.message;
    EXPECT_FALSE(recorder.isOnCallersThread);
    EXPECT_NE(dynamic_cast<FakeSslStream*>(recorder.lastStream.get()), nullptr);
    EXPECT_EQ(context_->label, "");
    EXPECT_EQ(context_->host, "127.0.0.1");
    EXPECT_EQ(context_->serverName, "sts.example");
    recorder.lastStream->Close();
  }
  EXPECT_EQ(context_->wraps, 2);
}

TEST_F(SsoCustomSslConnectionSpecImplTest, AFailedHandshakeIsReportedWithItsStream) {
  LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  context_->handshakeFailure = "certificate has expired";
  ConnectRecorder recorder;
  MakeSpec("127.0.0.1", listener.Port())->StartConnect(recorder.Completion());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.hasError);
  EXPECT_EQ(recorder.message, "certificate has expired");
  ASSERT_NE(dynamic_cast<FakeSslStream*>(recorder.lastStream.get()), nullptr);
  recorder.lastStream->Close();
}

TEST_F(SsoCustomSslConnectionSpecImplTest, AHandshakeThatCannotBeginIsReportedOnce) {
  LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  context_->handshakeRefusal = "the server name is invalid";
  ConnectRecorder recorder;
  MakeSpec("127.0.0.1", listener.Port())->StartConnect(recorder.Completion());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.hasError);
  EXPECT_EQ(recorder.message, "the server name is invalid");
  ASSERT_NE(recorder.lastStream, nullptr);
  recorder.lastStream->Close();
}

TEST_F(SsoCustomSslConnectionSpecImplTest, AFailedConnectNeverStartsAHandshake) {
  const LoopbackSocket notListening;  // so connects are refused
  ConnectRecorder recorder;
  MakeSpec("127.0.0.1", notListening.Port())->StartConnect(recorder.Completion());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.hasError);
  EXPECT_EQ(recorder.message, "Cannot connect to 127.0.0.1:" + std::to_string(notListening.Port()) +
                                  ": Connection refused");
  EXPECT_NE(dynamic_cast<Tarnik::System::TCPClientSocket*>(recorder.lastStream.get()), nullptr);
  EXPECT_EQ(context_->wraps, 0);
}

TEST_F(SsoCustomSslConnectionSpecImplTest, CancellingClosesTheSocketAndStartsNoHandshake) {
  const FullListener listener;
  ConnectRecorder recorder;
  const auto item = MakeSpec("127.0.0.1", listener.Port())->StartConnect(recorder.Completion());
  EXPECT_TRUE(item->Cancel());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.isCancelled) << recorder.message;
  EXPECT_EQ(context_->wraps, 0);
}

TEST_F(SsoCustomSslConnectionSpecImplTest, TheBindingKeepsTheContextUntilTheCompletionHasRun) {
  LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  ConnectRecorder recorder;
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
        const LoopbackSocket notListening;  // so connects are refused
        MakeSpec("127.0.0.1", notListening.Port())->StartConnect(nullptr);
        std::promise<void>().get_future().wait_for(std::chrono::seconds(20));
      },
      "bad_function_call");
}

TEST(ConnectionSpecsTest, MakeAPlainSpecAndReleaseWhatWasHeld) {
  Tarnik::Ref<ConnectionSpec> spec;
  CreateSsoConnectionSpec("old", 1, false, spec);
  const auto old = spec;
  EXPECT_EQ(old->RefCount(), 2);
  CreateSsoConnectionSpec("sts.example", 443, true, spec);
  EXPECT_EQ(old->RefCount(), 1);
  const auto* custom = dynamic_cast<const CustomConnectionSpec*>(spec.get());
  ASSERT_NE(custom, nullptr);
  EXPECT_EQ(custom->EndpointKey(), "sts.example:443");
}

TEST(ConnectionSpecsTest, MakeATlsSpecAroundAPlainOneAndReleaseWhatWasHeld) {
  const auto context = Tarnik::MakeRef<FakeSslContext>();
  Tarnik::Ref<ConnectionSpec> spec;
  CreateSsoConnectionSpec("old", 1, false, spec);
  const auto old = spec;
  CreateSsoSSLConnectionSpec("sts.example", 8443, context.get(), "peer", false, spec);
  EXPECT_EQ(old->RefCount(), 1);
  EXPECT_EQ(context->RefCount(), 2);
  const auto* custom = dynamic_cast<const CustomConnectionSpec*>(spec.get());
  ASSERT_NE(custom, nullptr);
  EXPECT_EQ(custom->EndpointKey(), "sts.example:8443");
  EXPECT_THAT(custom->ToString(), testing::EndsWith(", SsoCustomConnectionSpec:sts.example:8443>"));
}

TEST(ConnectionSpecsTest, DoNotCheckTheirArguments) {
  Tarnik::Ref<ConnectionSpec> spec;
  CreateSsoConnectionSpec("", -1, false, spec);
  EXPECT_EQ(dynamic_cast<const CustomConnectionSpec&>(*spec).EndpointKey(), ":-1");
  CreateSsoSSLConnectionSpec("a b", 70'000, nullptr, "", true, spec);
  EXPECT_EQ(dynamic_cast<const CustomConnectionSpec&>(*spec).EndpointKey(), "a b:70000");
}

}  // namespace
}  // namespace SsoClient::Testing
