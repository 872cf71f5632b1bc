// How connection specs use sockets.
#include <functional>

#include <gmock/gmock.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>

#include "calls/recorded_calls.h"
#include "transport/fake_ssl.h"
#include "transport/sso_connection_specs.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::Stream;
using testing::ElementsAre;

constexpr char kSocket[] = "socket of the pool";

class ConnectCallsTest : public testing::Test {
 protected:
  ConnectCallsTest() { ForgetCalls(); }
  ~ConnectCallsTest() override { ForgetCalls(); }

  Tarnik::Ref<SsoCustomSslConnectionSpecImpl> TlsSpec() {
    return Tarnik::MakeRef<SsoCustomSslConnectionSpecImpl>(
        sslContext_.get(), "peer",
        Tarnik::MakeRef<SsoCustomConnectionSpecImpl>("sts.example", 8443, false));
  }

  Tarnik::Ref<FakeSslContext> sslContext_ = Tarnik::MakeRef<FakeSslContext>();
};

TEST_F(ConnectCallsTest, APlainSpecPassesItsSocketAsTheStream) {
  for (const bool flag : {false, true}) {
    ForgetCalls();
    const auto spec = Tarnik::MakeRef<SsoCustomConnectionSpecImpl>("sts.example", 8443, flag);
    Stream* stream = nullptr;
    Tarnik::Exception* failure = nullptr;
    spec->StartConnect([&](Stream* connected, Tarnik::Exception* error) {
      stream = connected;
      failure = error;
    });
    EXPECT_THAT(Recorded().log, ElementsAre(kSocket, "connect to sts.example:8443"));
    RecordingSocket& socket = *Recorded().lastSocket;
    socket.completion(&socket, nullptr);
    EXPECT_EQ(stream, &socket);
    EXPECT_EQ(failure, nullptr);
    Tarnik::IOException error("refused");
    socket.completion(&socket, &error);
    EXPECT_EQ(stream, &socket);
    EXPECT_EQ(failure, &error);
  }
}

TEST_F(ConnectCallsTest, AnEmptyCompletionStaysEmpty) {
  Tarnik::MakeRef<SsoCustomConnectionSpecImpl>("sts.example", 8443, false)->StartConnect(nullptr);
  EXPECT_FALSE(Recorded().lastSocket->completion);
}

TEST_F(ConnectCallsTest, TheItemHoldsTheSocketThatItCloses) {
  const auto ignore = [](Stream*, Tarnik::Exception*) {};
  for (const bool isTls : {false, true}) {
    ForgetCalls();
    auto item = isTls ? TlsSpec()->StartConnect(ignore)
                      : Tarnik::MakeRef<SsoCustomConnectionSpecImpl>("sts.example", 8443, false)
                            ->StartConnect(ignore);
    EXPECT_EQ(Recorded().lastSocket->RefCount(), 2);
    EXPECT_TRUE(item->Cancel());
    EXPECT_THAT(Recorded().log, ElementsAre(kSocket, "connect to sts.example:8443", "close"));
    item = nullptr;
    EXPECT_EQ(Recorded().lastSocket->RefCount(), 1);
  }
}

TEST_F(ConnectCallsTest, ATlsSpecSharesItsContextWithThePendingConnect) {
  const auto spec = TlsSpec();
  EXPECT_EQ(sslContext_->RefCount(), 2);
  spec->StartConnect([](Stream*, Tarnik::Exception*) {});
  EXPECT_THAT(Recorded().log, ElementsAre(kSocket, "connect to sts.example:8443"));
  EXPECT_EQ(sslContext_->RefCount(), 3);
  Recorded().lastSocket->completion = nullptr;
  EXPECT_EQ(sslContext_->RefCount(), 2);
}

TEST_F(ConnectCallsTest, AFailedConnectOfATlsSpecIsReportedAtOnce) {
  Stream* stream = nullptr;
  Tarnik::Exception* failure = nullptr;
  TlsSpec()->StartConnect([&](Stream* connected, Tarnik::Exception* error) {
    stream = connected;
    failure = error;
  });
  RecordingSocket& socket = *Recorded().lastSocket;
  Tarnik::IOException error("refused");
  socket.completion(&socket, &error);
  EXPECT_EQ(stream, &socket);
  EXPECT_EQ(failure, &error);
  EXPECT_EQ(sslContext_->wraps, 0);
}

TEST_F(ConnectCallsTest, AnEmptyCompletionFailsWhenATlsSpecsConnectFails) {
  TlsSpec()->StartConnect(nullptr);
  RecordingSocket& socket = *Recorded().lastSocket;
  Tarnik::IOException error("refused");
  EXPECT_THROW(socket.completion(&socket, &error), std::bad_function_call);
}

}  // namespace
}  // namespace SsoClient::Testing
