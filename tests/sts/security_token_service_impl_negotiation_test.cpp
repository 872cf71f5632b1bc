#include <future>
#include <memory>
#include <stdexcept>
#include <string>
#include <typeinfo>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/negotiation_handler.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/security_token_service.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>

#include "describe/describe.h"
#include "sts/answers.h"
#include "sts/fake_sts.h"
#include "sts/log_capture.h"
#include "sts/token_specs.h"
#include "support/async_call.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

using Leg = std::vector<unsigned char>;
using LegHandle = std::shared_ptr<const Leg>;

constexpr char kContractError[] =
    "4 GSS contract error: non-empty user leg after negotiation is complete";

// Returns the next leg on each call, and records what it was given.
class ScriptedHandler final : public NegotiationHandler {
 public:
  explicit ScriptedHandler(std::vector<LegHandle> legs) : legs_(std::move(legs)) {}

  LegHandle Negotiate(const Leg& serverLeg) override {
    received.push_back(serverLeg);
    if (received.size() > legs_.size()) {
      throw std::out_of_range("the handler is asked too often");
    }
    return legs_[received.size() - 1];
  }

  std::vector<Leg> received;

 private:
  std::vector<LegHandle> legs_;
};

LegHandle LegOf(Leg bytes) {
  return std::make_shared<const Leg>(std::move(bytes));
}

TEST(NegotiatedLoginTest, ATokenOnTheFirstLegEndsTheLoopAfterOneExchange) {
  const FakeSts sts({LastLegAnswer()});
  ScriptedHandler handler({LegOf({7})});
  const auto token = sts.Service()->AcquireTokenByGSS(OneHour(), handler);
  ASSERT_NE(token, nullptr);
  EXPECT_EQ(token->Xml(), kCanonicalAssertion);
  EXPECT_THAT(sts.factory->tolerances, ElementsAre(600));
  EXPECT_THAT(handler.received, ElementsAre(Leg{}));
  EXPECT_THAT(sts.transport->actions,
              ElementsAre("http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue"));
  EXPECT_THAT(sts.transport->bodies[0], HasSubstr(">Bw==</wst:BinaryExchange>"));
}

TEST(NegotiatedLoginTest, LaterLegsContinueTheNegotiationInOneSession) {
  const FakeSts sts({LegAnswer("first"),
                     LegAnswer("second", "<wst:BinaryExchange>BAU=</wst:BinaryExchange>"),
                     LastLegAnswer()});
  ScriptedHandler handler({LegOf({1}), LegOf({2}), LegOf({})});
  EXPECT_NE(sts.Service()->AcquireTokenByGSS(OneHour(), handler), nullptr);
  EXPECT_EQ(sts.transport->sessions, 1);
  EXPECT_THAT(handler.received, ElementsAre(Leg{}, Leg({1, 2, 3}), Leg({4, 5})));
  const std::string issue = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";
  const std::string next = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Issue";
  EXPECT_THAT(sts.transport->actions, ElementsAre(issue, next, next));
  EXPECT_THAT(sts.transport->bodies[0], HasSubstr("<wst:RequestSecurityToken "));
  EXPECT_THAT(sts.transport->bodies[1],
              HasSubstr("<wst:RequestSecurityTokenResponse Context=\"first\">"));
  EXPECT_THAT(sts.transport->bodies[1], HasSubstr(">Ag==</wst:BinaryExchange>"));
  // The context is that of the last answer.
  EXPECT_THAT(sts.transport->bodies[2],
              HasSubstr("<wst:RequestSecurityTokenResponse Context=\"second\">"));
  EXPECT_THAT(sts.transport->bodies[2], Not(HasSubstr("Lifetime")));
}

TEST(NegotiatedLoginTest, TheOperationIsTraced) {
  const FakeSts sts({LastLegAnswer()});
  ScriptedHandler handler({LegOf({7})});
  const LogCapture log(7);
  const auto token = sts.Service()->AcquireTokenByGSS(OneHour(), handler);
  EXPECT_THAT(log.Lines(),
              ElementsAre("7 START operation SecurityTokenServiceImpl::AcquireTokenByGSS",
                          "7 Requested token with spec `" + Describe(OneHour()) + "'",
                          "5 Successfully acquired token: " + CreateSamlTokenDescription(*token),
                          "7 END operation SecurityTokenServiceImpl::AcquireTokenByGSS"));
}

struct LastLegCase {
  const char* name;
  LegHandle afterTheLast;
  bool isLogged;
};

class LastLegTest : public testing::TestWithParam<LastLegCase> {};

TEST_P(LastLegTest, IsPassedToTheHandlerWhoseAnswerIsNotSent) {
  const FakeSts sts({LastLegAnswer(kAssertionXml, kLeg)});
  ScriptedHandler handler({LegOf({7}), GetParam().afterTheLast});
  const LogCapture log(4);
  EXPECT_NE(sts.Service()->AcquireTokenByGSS(OneHour(), handler), nullptr);
  EXPECT_THAT(handler.received, ElementsAre(Leg{}, Leg({1, 2, 3})));
  EXPECT_EQ(sts.transport->bodies.size(), 1U);
  if (GetParam().isLogged) {
    EXPECT_THAT(log.Lines(), ElementsAre(kContractError));
  } else {
    EXPECT_THAT(log.Lines(), IsEmpty());
  }
}

INSTANTIATE_TEST_SUITE_P(Answers, LastLegTest,
                         testing::Values(LastLegCase{"Null", nullptr, true},
                                         LastLegCase{"Empty", LegOf({}), true},
                                         LastLegCase{"Bytes", LegOf({9}), false}),
                         [](const auto& tested) { return tested.param.name; });

TEST(NegotiatedLoginTest, TheLastLegIsPassedOnBeforeTheTokenIsMade) {
  const FakeSts sts({LastLegAnswer(kAssertionXml, kLeg)});
  sts.factory->isRefusing = true;
  ScriptedHandler handler({LegOf({7}), nullptr});
  const LogCapture log(5);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { sts.Service()->AcquireTokenByGSS(OneHour(), handler); }),
            "refused");
  EXPECT_THAT(handler.received, ElementsAre(Leg{}, Leg({1, 2, 3})));
  EXPECT_THAT(log.Lines(), ElementsAre(kContractError));
}

TEST(NegotiatedLoginTest, ANullLegFailsBeforeAnythingIsSent) {
  const FakeSts sts({LastLegAnswer()});
  ScriptedHandler handler({nullptr});
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>(
                [&] { sts.Service()->AcquireTokenByGSS(OneHour(), handler); }),
            "Invalid NegotiationHandler: the returned leg may not be NULL");
  EXPECT_THAT(sts.transport->bodies, IsEmpty());
}

TEST(NegotiatedLoginTest, ALaterNullLegEndsTheLogin) {
  const FakeSts sts({LegAnswer("c")});
  ScriptedHandler handler({LegOf({1}), nullptr});
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>(
                [&] { sts.Service()->AcquireTokenByGSS(OneHour(), handler); }),
            "Invalid NegotiationHandler: the returned leg may not be NULL");
  EXPECT_EQ(sts.transport->bodies.size(), 1U);
}

TEST(NegotiatedLoginTest, AnAnswerWithoutAContextIsRefusedEvenWithAToken) {
  for (const auto& answer : {LegAnswer(""), LastLegAnswer(kAssertionXml, "", "")}) {
    const FakeSts sts({answer});
    ScriptedHandler handler({LegOf({1})});
    EXPECT_EQ(ThrownMessage<CommunicationException>(
                  [&] { sts.Service()->AcquireTokenByGSS(OneHour(), handler); }),
              "Error processing the response to SPNego token request: no Context ID was returned.");
    EXPECT_THAT(sts.factory->texts, IsEmpty());
  }
}

TEST(NegotiatedLoginTest, TheLifetimeIsCheckedBeforeAnythingIsSent) {
  const FakeSts sts({LastLegAnswer()});
  ScriptedHandler handler({LegOf({1})});
  const LogCapture log(7);
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>(
                [&] { sts.Service()->AcquireTokenByGSS(TokenSpec(), handler); }),
            "Token lifetime must be positive");
  EXPECT_THAT(sts.transport->bodies, IsEmpty());
  // The session and the leg come first.
  EXPECT_EQ(sts.transport->sessions, 1);
  EXPECT_THAT(handler.received, ElementsAre(Leg{}));
  EXPECT_THAT(log.Lines(),
              ElementsAre("7 START operation SecurityTokenServiceImpl::AcquireTokenByGSS",
                          "7 Requested token with spec `" + Describe(TokenSpec()) + "'",
                          "7 END operation SecurityTokenServiceImpl::AcquireTokenByGSS"));
}

struct HandlersOwnFailure {};

class ThrowingHandler final : public NegotiationHandler {
 public:
  LegHandle Negotiate(const Leg& serverLeg) override {
    if (serverLeg.empty()) {
      return LegOf({1});
    }
    throw HandlersOwnFailure();
  }
};

TEST(NegotiatedLoginTest, WhatTheHandlerThrowsPassesUnchanged) {
  ThrowingHandler handler;
  EXPECT_THROW(FakeSts({LegAnswer("c")}).Service()->AcquireTokenByGSS(OneHour(), handler),
               HandlersOwnFailure);
  const LogCapture log(7);
  EXPECT_THROW(FakeSts({LastLegAnswer(kAssertionXml, kLeg)})
                   .Service()
                   ->AcquireTokenByGSS(OneHour(), handler),
               HandlersOwnFailure);
  EXPECT_EQ(log.Lines().back(), "7 END operation SecurityTokenServiceImpl::AcquireTokenByGSS");
}

TEST(NegotiatedLoginAsyncTest, ReportsTokenAndErrors) {
  ScriptedHandler handler({LegOf({1})});
  AsyncCall call;
  auto spec = OneHour();
  spec.audienceRestriction = {"urn:audience"};
  const LogCapture log(7);
  FakeSts({LastLegAnswer()}).Service()->AcquireTokenByGSSAsync(spec, handler, call.Callback());
  EXPECT_NE(call.Wait().token, nullptr);
  EXPECT_EQ(log.Lines().at(1), "7 Requested token with spec `" + Describe(spec) + "'");
  ScriptedHandler nullHandler({nullptr});
  AsyncCall failing;
  FakeSts({LastLegAnswer()})
      .Service()
      ->AcquireTokenByGSSAsync(OneHour(), nullHandler, failing.Callback());
  EXPECT_EQ(failing.Wait().errorType, typeid(Tarnik::InvalidArgumentException).name());
  EXPECT_THROW(
      FakeSts({LastLegAnswer()}).Service()->AcquireTokenByGSSAsync(OneHour(), handler, nullptr),
      Tarnik::InvalidArgumentException);
}

// Fails in its first leg.
template <class Error>
class FailingHandler final : public NegotiationHandler {
 public:
  LegHandle Negotiate(const Leg&) override { throw Error("from the handler"); }
};

class HandlersOwnException : public SsoException {
 public:
  using SsoException::SsoException;
};

TEST(NegotiatedLoginAsyncTest, WhatTheHandlerThrowsReachesTheCallbackUnchanged) {
  const FakeSts sts({LastLegAnswer()});
  FailingHandler<HandlersOwnException> handler;
  AsyncCall call;
  sts.Service()->AcquireTokenByGSSAsync(OneHour(), handler, call.Callback());
  const auto report = call.Wait();
  EXPECT_EQ(report.token, nullptr);
  EXPECT_EQ(report.errorType, typeid(HandlersOwnException).name());
  EXPECT_EQ(report.message, "from the handler");
}

TEST(NegotiatedLoginAsyncDeathTest, AnotherKindOfExceptionEndsTheProcess) {
  testing::GTEST_FLAG(death_test_style) = "threadsafe";
  EXPECT_DEATH(
      {
        FailingHandler<std::runtime_error> handler;
        AsyncCall call;
        FakeSts({LastLegAnswer()})
            .Service()
            ->AcquireTokenByGSSAsync(OneHour(), handler, call.Callback());
        call.Wait();
      },
      "from the handler");
}

// Waits within its first leg.
class WaitingHandler final : public NegotiationHandler {
 public:
  LegHandle Negotiate(const Leg&) override {
    isGoingOn.get_future().wait();
    return LegOf({1});
  }

  std::promise<void> isGoingOn;
};

TEST(NegotiatedLoginAsyncTest, ACallReturnsAtOnceAndUsesACopyOfTheService) {
  const FakeSts sts({LastLegAnswer()});
  auto service = sts.Service();
  const std::weak_ptr<const SecurityTokenService> original = service;
  WaitingHandler handler;
  AsyncCall call;
  service->AcquireTokenByGSSAsync(OneHour(), handler, call.Callback());
  service = nullptr;
  EXPECT_TRUE(original.expired());
  handler.isGoingOn.set_value();
  EXPECT_NE(call.Wait().token, nullptr);
  EXPECT_EQ(sts.transport->bodies.size(), 1U);
}

TEST(NegotiatedLoginTest, OperationsKeepTheirSlotOrder) {
  using Token = std::shared_ptr<const SamlToken>;
  const auto service = FakeSts({LastLegAnswer()}).Service();
  const SecurityTokenService* object = service.get();
  ScriptedHandler handler({LegOf({1})});
  EXPECT_NE((VtableSlot<Token(const void*, const TokenSpec&, NegotiationHandler&)>(object, 1)(
                object, OneHour(), handler)),
            nullptr);
  ScriptedHandler asyncHandler({LegOf({1})});
  AsyncCall call;
  VtableSlot<void(const void*, const TokenSpec&, NegotiationHandler&,
                  SecurityTokenService::TokenCallback)>(object, 7)(object, OneHour(), asyncHandler,
                                                                   call.Callback());
  EXPECT_NE(call.Wait().token, nullptr);
}

}  // namespace
}  // namespace SsoClient::Testing
