// Logins by Kerberos at the dev STS, with tickets of a real KDC.
#include <cstddef>
#include <memory>
#include <ostream>
#include <set>
#include <string>

#include <gmock/gmock.h>

#include "negotiation/realm_fixture.h"
#include "sts/log_capture.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;

/// A way to log in, and the number of its legs.
struct Way {
  const char* name;
  bool byContext;
  DevSts::NegotiationScript script;
  std::size_t legs;
};

void PrintTo(const Way& way, std::ostream* stream) {
  *stream << way.name;
}

class NegotiatedLoginTest : public RealmTest, public testing::WithParamInterface<Way> {
 protected:
  std::shared_ptr<const SamlToken> LogIn(NegotiationHandler& handler) {
    return GetParam().byContext ? LogInByContext(*Context(), handler)
                                : Service()->AcquireTokenByGSS(TenMinutes(), handler);
  }
};

TEST_P(NegotiatedLoginTest, ReturnsATokenForTheTicketsOwner) {
  Sts().SetNegotiationScript(GetParam().script);
  const std::size_t open = Sts().OpenNegotiations();
  const auto handler = Alice();
  const auto token = LogIn(*handler);
  ASSERT_NE(token, nullptr);
  EXPECT_EQ(token->Subject(), (PrincipalId{"alice", "EXAMPLE.COM"}));
  EXPECT_EQ(token->ConfirmationType(), BEARER);
  EXPECT_TRUE(handler->IsEstablished());
  EXPECT_EQ(Sts().OpenNegotiations(), open);
}

TEST_P(NegotiatedLoginTest, SendsItsLegsInOneSession) {
  Sts().SetNegotiationScript(GetParam().script);
  LogIn(*Alice());
  const auto requests = Sts().Requests();
  ASSERT_EQ(requests.size(), GetParam().legs);
  for (std::size_t i = 0; i < requests.size(); ++i) {
    SCOPED_TRACE(i);
    ASSERT_TRUE(requests[i].leg);
    EXPECT_EQ(requests[i].leg->ordinal, i + 1);
    EXPECT_EQ(requests[i].connectionId, requests[0].connectionId);
    EXPECT_EQ(requests[i].HeaderCount("Cookie"), i == 0 ? 0U : 1U);
    EXPECT_EQ(requests[i].answeredStatus, 200);
    EXPECT_EQ(requests[i].leg->context, requests[0].leg->context);
    EXPECT_EQ(requests[i].leg->octets.empty(), i > (kSignsMechanisms ? 1 : 0));
  }
}

TEST_P(NegotiatedLoginTest, WorksWithAKeytab) {
  Sts().SetNegotiationScript(GetParam().script);
  const auto token = LogIn(*CreateGssapiNegotiationHandler(AsMachine()));
  ASSERT_NE(token, nullptr);
  EXPECT_EQ(token->Subject(), (PrincipalId{"machine", "EXAMPLE.COM"}));
  EXPECT_TRUE(token->IsSolution());
}

TEST_P(NegotiatedLoginTest, WorksRepeatedlyWithOneHandler) {
  Sts().SetNegotiationScript(GetParam().script);
  const auto handler = Alice();
  const auto first = LogIn(*handler);
  const auto second = LogIn(*handler);
  EXPECT_NE(first->Id(), second->Id());
}

INSTANTIATE_TEST_SUITE_P(
    Ways, NegotiatedLoginTest,
    testing::Values(Way{"LoopOneLeg", false, {}, 1}, Way{"ContextOneLeg", true, {}, 1},
                    Way{"LoopSeveralLegs", false, TwoLegs(), 2},
                    Way{"ContextSeveralLegs", true, TwoLegs(), 2},
                    Way{"LoopMoreLegsThanKerberosNeeds", false, TwoLegs(2), 4},
                    Way{"ContextMoreLegsThanKerberosNeeds", true, TwoLegs(2), 4}),
    [](const auto& test) { return test.param.name; });

class NegotiatedTokenTest : public RealmTest {};

TEST_F(NegotiatedTokenTest, IsBoundToTheConfiguredKey) {
  Sts().SetNegotiationScript(TwoLegs());
  const auto token = HolderService()->AcquireTokenByGSS(RenewableAndDelegable(), *Alice());
  EXPECT_TRUE(IsBoundTo(*token, Holder()));
  EXPECT_TRUE(token->IsRenewable());
  EXPECT_TRUE(token->IsDelegable());
  const auto requests = Sts().Requests();
  ASSERT_EQ(requests.size(), 2U);
  EXPECT_EQ(requests[0].signature, DevSts::RequestSignature::ByCertificate);
  EXPECT_EQ(requests[1].signature, DevSts::RequestSignature::None);
}

TEST_F(NegotiatedTokenTest, IsAcceptedByTheOtherOperations) {
  const auto service = HolderService();
  const auto token = service->AcquireTokenByGSS(RenewableAndDelegable(), *Alice());
  EXPECT_TRUE(service->ValidateSubject(*token));
  EXPECT_EQ(service->RenewToken(*token, 1200)->Subject(), token->Subject());
  EXPECT_EQ(service->AcquireTokenByToken(*token, TenMinutes())->Subject(), token->Subject());
}

TEST_F(NegotiatedTokenTest, HasWhatTheSpecRequests) {
  TokenSpec spec = TenMinutes();
  spec.audienceRestriction = {"urn:one", "urn:two"};
  spec.tokenLifetimeSec = 300;
  Sts().SetNegotiationScript(TwoLegs(1));
  const auto token = Service()->AcquireTokenByGSS(spec, *Alice());
  std::set<std::string> audiences;
  token->GetAudiences(audiences);
  EXPECT_EQ(audiences, spec.audienceRestriction);
  EXPECT_EQ(token->ExpirationTime().GetUtcTime() - token->StartTime().GetUtcTime(), 300'000'000);
}

TEST_F(NegotiatedTokenTest, WritesItsLinesInOrder) {
  const LogCapture log(9);
  const auto token = Service()->AcquireTokenByGSS(TenMinutes(), *Alice());
  EXPECT_THAT(
      log.Lines(),
      ElementsAre("7 START operation SecurityTokenServiceImpl::AcquireTokenByGSS",
                  "7 Requested token with spec `TokenSpec [tokenLifetimeSec=600, delegable=false, "
                  "delegateTo=<unset>, renewable=false, confirmationType=0,audienceRestriction=, "
                  "advice=[]'",
                  "4 GSS contract error: non-empty user leg after negotiation is complete",
                  "5 Successfully acquired token: " + CreateSamlTokenDescription(*token),
                  "7 END operation SecurityTokenServiceImpl::AcquireTokenByGSS"));
}

}  // namespace
}  // namespace SsoClient::Testing
