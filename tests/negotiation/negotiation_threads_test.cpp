// Many logins at once, and the asynchronous twin.
#include <gmock/gmock.h>

#include <future>
#include <thread>

#include "negotiation/realm_fixture.h"

namespace SsoClient::Tests {
namespace {

DevSts::NegotiationScript TwoLegs() {
  DevSts::NegotiationScript script;
  script.requestMic = true;
  return script;
}

class NegotiationThreadsTest : public RealmTest {
 protected:
  NegotiationThreadsTest() { Sts().SetNegotiationScript(TwoLegs()); }
};

TEST_F(NegotiationThreadsTest, LogInSideBySide) {
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

/// What a callback received, kept beyond the call.
struct Outcome {
  std::shared_ptr<const SamlToken> token;
  std::unique_ptr<Tarnik::Throwable> error;
};

std::future<Outcome> Start(const SecurityTokenService& service, NegotiationHandler& handler) {
  // Shared, since the callback may still be leaving when the outcome is here.
  const auto outcome = std::make_shared<std::promise<Outcome>>();
  service.AcquireTokenByGSSAsync(
      TenMinutes(), handler,
      [outcome](const std::shared_ptr<const SamlToken>& token, const Tarnik::Exception* error) {
        outcome->set_value({token, error == nullptr ? nullptr : error->Clone()});
      });
  return outcome->get_future();
}

TEST_F(NegotiationThreadsTest, AsyncLoginsRunSideBySide) {
  std::vector<std::shared_ptr<GssapiNegotiationHandler>> handlers;
  std::vector<std::future<Outcome>> outcomes;
  for (int i = 0; i < 8; ++i) {
    handlers.push_back(Alice());
    outcomes.push_back(Start(*Service(), *handlers.back()));
  }
  for (auto& outcome : outcomes) {
    const auto token = outcome.get().token;
    ASSERT_NE(token, nullptr);
    EXPECT_EQ(token->Subject().name, "alice");
  }
}

TEST_F(NegotiationThreadsTest, AsyncFailureOfKerberosReachesTheCallback) {
  auto config = AsAlice();
  config.targetService = "HTTP@unknown.example";
  const auto handler = CreateGssapiNegotiationHandler(config);
  const auto outcome = Start(*Service(), *handler).get();
  EXPECT_EQ(outcome.token, nullptr);
  ASSERT_NE(outcome.error, nullptr);
  EXPECT_EQ(typeid(*outcome.error), typeid(SsoException));
  EXPECT_THAT(outcome.error->Message(), ::testing::HasSubstr("not found in Kerberos database"));
}

}  // namespace
}  // namespace SsoClient::Tests
