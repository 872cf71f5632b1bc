// The exceptions that a caller receives when the service fails in the middle of a negotiation.
#include <cstddef>
#include <memory>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "negotiation/realm_fixture.h"
#include "sts/log_capture.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;
using testing::IsEmpty;

const DevSts::NegotiationScript kOneLeg;

class NegotiationFaultsTest : public RealmTest {
 protected:
  NegotiationFaultsTest() { Sts().SetNegotiationScript(TwoLegs()); }

  static void LogIn() { Service()->AcquireTokenByGSS(TenMinutes(), *Alice()); }
  static void MisbehaveOnce(const DevSts::LegMisbehavior& leg) {
    DevSts::Misbehavior misbehavior;
    misbehavior.leg = leg;
    Sts().MisbehaveNext(misbehavior);
  }
};

TEST_F(NegotiationFaultsTest, AForgottenNegotiationIsTheServicesFault) {
  DevSts::LegMisbehavior leg;
  leg.forget = true;
  MisbehaveOnce(leg);
  EXPECT_EQ(MessageOf<SsoException>(LogIn),
            "Unexpected SOAP fault: wst:InvalidRequest; request failed.");
  EXPECT_THAT(Sts().LastRequest().answeredFault, HasSubstr("No negotiation is under way"));
  EXPECT_EQ(Sts().Requests().size(), 2U);
}

TEST_F(NegotiationFaultsTest, AnEmptyContextIdEndsTheLoop) {
  DevSts::LegMisbehavior leg;
  leg.context = "";
  MisbehaveOnce(leg);
  EXPECT_EQ(MessageOf<CommunicationException>(LogIn),
            "Error processing the response to SPNego token request: no Context ID was returned.");
  EXPECT_EQ(Sts().Requests().size(), 1U);
}

TEST_F(NegotiationFaultsTest, AfterAnEmptyContextIdTheNextCallStartsANewNegotiation) {
  const auto context = Context();
  const auto handler = Alice();
  DevSts::LegMisbehavior leg;
  leg.context = "";
  MisbehaveOnce(leg);
  const auto lost = context->Negotiate(*handler->Negotiate({}));
  EXPECT_EQ(lost.token, nullptr);
  ASSERT_NE(lost.outputLeg, nullptr);
  EXPECT_FALSE(lost.outputLeg->empty());
  // The next call starts a new negotiation with a new login.
  EXPECT_NE(LogInByContext(*context, *handler), nullptr);
  EXPECT_EQ(Legs().at(1).ordinal, 1U);
}

TEST_F(NegotiationFaultsTest, AnEmptyLegInTheMiddleIsNotAnAnswer) {
  for (const bool omit : {false, true}) {
    Sts().ClearRequests();
    DevSts::LegMisbehavior leg;
    leg.omitLeg = omit;
    if (!omit) {
      leg.leg = "";
    }
    MisbehaveOnce(leg);
    EXPECT_EQ(MessageOf<SsoException>(LogIn), "Unexpected XML format");
    EXPECT_EQ(Sts().Requests().size(), 1U);
  }
}

TEST_F(NegotiationFaultsTest, AnEmptyLegWithTheTokenEndsTheLogin) {
  Sts().SetNegotiationScript(kOneLeg);
  DevSts::LegMisbehavior leg;
  leg.leg = "";
  MisbehaveOnce(leg);
  const auto handler = Alice();
  EXPECT_NE(Service()->AcquireTokenByGSS(TenMinutes(), *handler), nullptr);
  // Kerberos has not authenticated the service.
  EXPECT_FALSE(handler->IsEstablished());
}

TEST_F(NegotiationFaultsTest, ALateFailureIsTheServicesFault) {
  auto script = TwoLegs();
  script.failAtLeg = 2;
  Sts().SetNegotiationScript(script);
  EXPECT_THAT(MessageOf<InvalidCredentialsException>(LogIn),
              HasSubstr("The negotiation is configured to fail"));
  const auto context = Context();
  const auto handler = Alice();
  EXPECT_THAT(MessageOf<InvalidCredentialsException>([&] { LogInByContext(*context, *handler); }),
              HasSubstr("The negotiation is configured to fail"));
}

TEST_F(NegotiationFaultsTest, AServiceThatRequiresACookieItNeverSetRefuses) {
  DevSts::LegMisbehavior leg;
  leg.omitCookie = true;
  MisbehaveOnce(leg);
  EXPECT_THROW(LogIn(), SsoException);
  EXPECT_EQ(Sts().LastRequest().HeaderCount("Cookie"), 0U);
}

TEST_F(NegotiationFaultsTest, ACutConnectionIsACommunicationFailure) {
  for (const std::size_t leg : {1U, 2U}) {
    Sts().ClearMisbehavior();
    DevSts::Misbehavior cut;
    cut.cutOff = DevSts::CutOff{10};
    Sts().MisbehaveNext({}, leg - 1);
    Sts().MisbehaveNext(cut);
    EXPECT_THROW(LogIn(), CommunicationException) << leg;
  }
}

TEST_F(NegotiationFaultsTest, APrincipalWithoutAnAccountIsRefused) {
  auto nobody = AsAlice();
  nobody.credentialCache = Realm().Login("nobody", "nobody-secret");
  const auto handler = CreateGssapiNegotiationHandler(nobody);
  MessageOf<InvalidCredentialsException>(
      [&] { Service()->AcquireTokenByGSS(TenMinutes(), *handler); });
}

TEST_F(NegotiationFaultsTest, FailureStillWritesTheEndLine) {
  const LogCapture log(7);
  auto script = TwoLegs();
  script.failAtLeg = 1;
  Sts().SetNegotiationScript(script);
  EXPECT_THROW(LogIn(), InvalidCredentialsException);
  ASSERT_EQ(log.Lines().size(), 3U);
  EXPECT_EQ(log.Lines().front(), "7 START operation SecurityTokenServiceImpl::AcquireTokenByGSS");
  EXPECT_EQ(log.Lines().back(), "7 END operation SecurityTokenServiceImpl::AcquireTokenByGSS");
}

/// A class that the library does not know.
struct HandlersOwn {
  int value;
};

class OddHandler final : public NegotiationHandler {
 public:
  explicit OddHandler(int callToFail) : callToFail_(callToFail) {}

  std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>& serverLeg) override {
    if (++calls_ == callToFail_) {
      throw HandlersOwn{calls_};
    }
    return legs_->Negotiate(serverLeg);
  }

  std::shared_ptr<NegotiationHandler> legs_;

 private:
  int callToFail_;
  int calls_ = 0;
};

TEST_F(NegotiationFaultsTest, WhatTheHandlerThrowsReachesTheCallerUnchanged) {
  // With one leg, the second call is made after the last leg of the service.
  for (const auto& [script, call] :
       {std::pair{TwoLegs(), 1}, std::pair{TwoLegs(), 2}, std::pair{kOneLeg, 2}}) {
    Sts().SetNegotiationScript(script);
    Sts().ClearRequests();
    OddHandler handler(call);
    handler.legs_ = Alice();
    try {
      Service()->AcquireTokenByGSS(TenMinutes(), handler);
      ADD_FAILURE() << "nothing was thrown";
    } catch (const HandlersOwn& thrown) {
      EXPECT_EQ(thrown.value, call);
    }
    EXPECT_EQ(Sts().Requests().size(), static_cast<std::size_t>(call - 1));
  }
}

class SilentHandler final : public NegotiationHandler {
 public:
  std::shared_ptr<const std::vector<unsigned char>> Negotiate(
      const std::vector<unsigned char>&) override {
    return nullptr;
  }
};

TEST_F(NegotiationFaultsTest, AHandlerWithoutALegIsRefusedBeforeAnythingIsSent) {
  SilentHandler handler;
  EXPECT_EQ(MessageOf<Tarnik::InvalidArgumentException>(
                [&] { Service()->AcquireTokenByGSS(TenMinutes(), handler); }),
            "Invalid NegotiationHandler: the returned leg may not be NULL");
  EXPECT_THAT(Sts().Requests(), IsEmpty());
}

}  // namespace
}  // namespace SsoClient::Testing
