// Concurrent and asynchronous logins.
#include <cstddef>
#include <memory>
#include <thread>
#include <typeinfo>
#include <vector>

#include <gmock/gmock.h>

#include "negotiation/realm_fixture.h"
#include "support/async_call.h"

namespace SsoClient::Testing {
namespace {

class NegotiationThreadsTest : public RealmTest {
 protected:
  NegotiationThreadsTest() { Sts().SetNegotiationScript(TwoLegs()); }
};

TEST_F(NegotiationThreadsTest, RunLoginsInParallel) {
  const auto service = Service();
  std::vector<std::thread> threads;
  for (int i = 0; i < 8; ++i) {
    threads.emplace_back([&, byContext = i % 2 == 0, asMachine = i % 4 == 0] {
      const auto handler = CreateGssapiNegotiationHandler(asMachine ? AsMachine() : AsAlice());
      const auto token = byContext ? LogInByContext(*Context(), *handler)
                                   : service->AcquireTokenByGSS(TenMinutes(), *handler);
      EXPECT_EQ(token->Subject().name, asMachine ? "machine" : "alice");
    });
  }
  for (auto& thread : threads) {
    thread.join();
  }
}

TEST_F(NegotiationThreadsTest, AsyncLoginsRunInParallel) {
  const auto service = Service();
  std::vector<std::shared_ptr<GssapiNegotiationHandler>> handlers(8);
  std::vector<AsyncCall> calls(handlers.size());
  for (std::size_t i = 0; i < calls.size(); ++i) {
    handlers[i] = Alice();
    service->AcquireTokenByGSSAsync(TenMinutes(), *handlers[i], calls[i].Callback());
  }
  for (auto& call : calls) {
    const auto report = call.Wait();
    EXPECT_EQ(report.token == nullptr ? report.message : report.token->Subject().name, "alice");
  }
}

TEST_F(NegotiationThreadsTest, AsyncFailureOfKerberosReachesTheCallback) {
  auto config = AsAlice();
  config.targetService = "HTTP@unknown.example";
  const auto handler = CreateGssapiNegotiationHandler(config);
  AsyncCall call;
  Service()->AcquireTokenByGSSAsync(TenMinutes(), *handler, call.Callback());
  const auto report = call.Wait();
  EXPECT_EQ(report.token, nullptr);
  EXPECT_EQ(report.errorType, typeid(SsoException).name());
  EXPECT_THAT(report.message, testing::HasSubstr("not found in Kerberos database"));
}

}  // namespace
}  // namespace SsoClient::Testing
