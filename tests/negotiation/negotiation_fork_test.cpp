// Logins in a child of a process that has logged in.
#include <memory>

#include <gtest/gtest.h>

#include "negotiation/realm_fixture.h"
#include "support/async_call.h"
#include "support/forked_child.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::Testing::HoldsInChild;

class NegotiationForkTest : public RealmTest {
 protected:
  NegotiationForkTest() { Sts().SetNegotiationScript(TwoLegs()); }

  static bool IsOfAlice(const std::shared_ptr<const SamlToken>& token) {
    return token != nullptr && token->Subject().name == "alice";
  }

  const std::shared_ptr<SecurityTokenService> service_ = Service();
  const std::shared_ptr<GssapiNegotiationHandler> handler_ = Alice();
};

TEST_F(NegotiationForkTest, AChildLogsInWithTheObjectsOfItsParent) {
  ASSERT_TRUE(IsOfAlice(service_->AcquireTokenByGSS(TenMinutes(), *handler_)));
  EXPECT_TRUE(HoldsInChild([this] {
    return IsOfAlice(service_->AcquireTokenByGSS(TenMinutes(), *handler_)) &&
           handler_->IsEstablished();
  }));
  EXPECT_TRUE(IsOfAlice(service_->AcquireTokenByGSS(TenMinutes(), *handler_)));
}

TEST_F(NegotiationForkTest, AChildBindsItsTokenToTheKey) {
  const auto service = HolderService();
  Sts().RegisterCertificate(kMachine, Holder().certificatePem);
  ASSERT_TRUE(IsBoundTo(*service->AcquireTokenByGSS(TenMinutes(), *handler_), Holder()));
  EXPECT_TRUE(HoldsInChild([&] {
    AsyncCall call;
    service->AcquireTokenByGSSAsync(TenMinutes(), *handler_, call.Callback());
    const auto report = call.Wait();
    return IsOfAlice(report.token) && IsBoundTo(*report.token, Holder());
  }));
}

TEST_F(NegotiationForkTest, AChildContinuesTheNegotiationOfItsParent) {
  const auto context = Context();
  const auto answer = context->Negotiate(*handler_->Negotiate({}));
  ASSERT_EQ(answer.token, nullptr);
  EXPECT_TRUE(HoldsInChild([&] {
    auto next = context->Negotiate(*handler_->Negotiate(*answer.outputLeg));
    return IsOfAlice(next.token);
  }));
}

}  // namespace
}  // namespace SsoClient::Testing
