#include "transport/sso_connection_specs.h"

#include <gmock/gmock.h>

#include <sstream>

#include "transport/connect_recorder.h"
#include "transport/loopback_server.h"
#include "transport/spec_slots.h"

namespace SsoClient {
namespace {

Tarnik::Ref<SsoCustomConnectionSpecImpl> MakeSpec(const std::string& host, int port,
                                                  bool flag = false) {
  return Tarnik::MakeRef<SsoCustomConnectionSpecImpl>(host, port, flag);
}

TEST(SsoCustomConnectionSpecImplTest, TellsTheConfiguredEndpoint) {
  for (const bool flag : {false, true}) {
    const auto spec = MakeSpec("sts.example", 443, flag);
    EXPECT_EQ(spec->Host(), "sts.example");
    EXPECT_EQ(spec->CookieHost(), "sts.example");
    EXPECT_EQ(spec->EndpointKey(), "sts.example:443");
    EXPECT_FALSE(spec->IsProxy());
    EXPECT_EQ(spec->ChooseHost(), "sts.example");
  }
}

TEST(SsoCustomConnectionSpecImplTest, KeysHaveNoBrackets) {
  EXPECT_EQ(MakeSpec("::1", 8443)->EndpointKey(), "::1:8443");
  EXPECT_EQ(MakeSpec("%1%2", 1)->EndpointKey(), "%1%2:1");
}

TEST(SsoCustomConnectionSpecImplTest, DescribesItselfByAddressAndEndpoint) {
  const auto spec = MakeSpec("sts.example", 443);
  std::ostringstream address;
  address << static_cast<const void*>(spec.get());
  EXPECT_EQ(spec->ToString(),
            "<cs p:" + address.str() + ", SsoCustomConnectionSpec:sts.example:443>");
}

TEST(SsoCustomConnectionSpecImplTest, AllSlotsStandInTheirOrder) {
  Testing::CheckSpecSlots(
      [](int port) { return new SsoCustomConnectionSpecImpl("127.0.0.1", port, false); });
}

TEST(SsoCustomConnectionSpecImplTest, ConnectsWithAndWithoutTheFlag) {
  Testing::LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 4), 0);
  for (const bool flag : {false, true}) {
    Testing::ConnectRecorder recorder;
    const auto item =
        MakeSpec("127.0.0.1", listener.Port(), flag)->StartConnect(recorder.Completion());
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
  Testing::LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 4), 0);
  const auto spec = MakeSpec("127.0.0.1", listener.Port());
  Testing::ConnectRecorder first;
  Testing::ConnectRecorder second;
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
  const Testing::LoopbackSocket deaf;  // bound, but nobody listens: refused
  Testing::ConnectRecorder recorder;
  MakeSpec("127.0.0.1", deaf.Port())->StartConnect(recorder.Completion());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.hasError);
  EXPECT_FALSE(recorder.isOnCallersThread);
  EXPECT_EQ(recorder.message,
            "Cannot connect to 127.0.0.1:" + std::to_string(deaf.Port()) + ": Connection refused");
}

TEST(SsoCustomConnectionSpecImplTest, CancellingClosesTheSocket) {
  const Testing::FullListener listener;
  Testing::ConnectRecorder recorder;
  const auto item = MakeSpec("127.0.0.1", listener.Port())->StartConnect(recorder.Completion());
  EXPECT_TRUE(item->Cancel());
  recorder.Wait();
  EXPECT_EQ(recorder.calls, 1);
  EXPECT_TRUE(recorder.isCancelled) << recorder.message;
  EXPECT_TRUE(item->Cancel());
}

TEST(SsoCustomConnectionSpecImplTest, AnEmptyCompletionIsAllowed) {
  Testing::LoopbackSocket listener;
  ASSERT_EQ(::listen(listener.Descriptor(), 1), 0);
  const auto item = MakeSpec("127.0.0.1", listener.Port())->StartConnect(nullptr);
  ASSERT_NE(item, nullptr);
  const int accepted = ::accept(listener.Descriptor(), nullptr, nullptr);
  EXPECT_GE(accepted, 0);
  ::close(accepted);
  EXPECT_TRUE(item->Cancel());
}

}  // namespace
}  // namespace SsoClient
