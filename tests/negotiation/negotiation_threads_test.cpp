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

using Token = std::shared_ptr<const SamlToken>;

std::future<Token> Start(const SecurityTokenService& service, NegotiationHandler& handler) {
  const auto result = std::make_shared<std::promise<Token>>();
  service.AcquireTokenByGSSAsync(TenMinutes(), handler,
                                 [result](const Token& token, const Tarnik::Exception* error) {
                                   try {
                                     error == nullptr ? result->set_value(token) : error->Throw();
                                   } catch (...) {
                                     result->set_exception(std::current_exception());
                                   }
                                 });
  return result->get_future();
}

TEST_F(NegotiationThreadsTest, AsyncLoginsRunSideBySide) {
  std::vector<std::shared_ptr<GssapiNegotiationHandler>> handlers;
  std::vector<std::future<Token>> tokens;
  for (int i = 0; i < 8; ++i) {
    handlers.push_back(Alice());
    tokens.push_back(Start(*Service(), *handlers.back()));
  }
  for (auto& token : tokens) {
    EXPECT_EQ(token.get()->Subject().name, "alice");
  }
}

TEST_F(NegotiationThreadsTest, AsyncFailureOfKerberosReachesTheCallback) {
  auto config = AsAlice();
  config.targetService = "HTTP@unknown.example";
  const auto handler = CreateGssapiNegotiationHandler(config);
  auto token = Start(*Service(), *handler);
  EXPECT_THAT(MessageOf<SsoException>([&] { token.get(); }),
              ::testing::HasSubstr("not found in Kerberos database"));
}

}  // namespace
}  // namespace SsoClient::Tests
