#include "sts/security_token_service_impl.h"

#include <memory>
#include <string>
#include <typeinfo>

#include <boost/none.hpp>
#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/security_token_service.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/reader.h>

#include "describe/describe.h"
#include "sts/answers.h"
#include "sts/fakes.h"
#include "sts/log_capture.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "sts/token_specs.h"
#include "support/async_call.h"
#include "support/fake_saml_token.h"
#include "support/holder_of_key.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

class EmptyResponseHandler final : public ResponseHandler {
 public:
  void ParseIssueResponse(Tarnik::Reader*, std::string& assertion) const override {
    assertion.clear();
  }
  bool ParseValidateResponse(Tarnik::Reader*) const override { return false; }
  void ParseRenewResponse(Tarnik::Reader*, std::string&) const override {}
  void ParseNegotiationResponse(Tarnik::Reader*, NegotiationResponse&) const override {}
};

class SecurityTokenServiceImplTest : public testing::Test {
 protected:
  explicit SecurityTokenServiceImplTest(const std::string& answer = IssueAnswer())
      : transport_(std::make_shared<FakeTransport>(answer)) {}

  std::shared_ptr<SecurityTokenServiceImpl> MakeService() const {
    return std::make_shared<SecurityTokenServiceImpl>(
        std::make_shared<RequestBuilderImpl>(boost::none), transport_,
        std::make_shared<ResponseHandlerImpl>(), factory_);
  }

  std::shared_ptr<FakeTransport> transport_;
  std::shared_ptr<FakeTokenFactory> factory_ = std::make_shared<FakeTokenFactory>();
};

TEST_F(SecurityTokenServiceImplTest, SendsTheRequestAndMakesATokenFromTheAnswer) {
  const auto token = MakeService()->AcquireToken("alice", "hunter2", OneHour());
  ASSERT_NE(token, nullptr);
  EXPECT_EQ(token->Xml(), kCanonicalAssertion);
  EXPECT_EQ(transport_->sessions, 1);
  EXPECT_THAT(transport_->actions,
              ElementsAre("http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue"));
  ASSERT_EQ(transport_->bodies.size(), 1U);
  EXPECT_THAT(transport_->bodies[0], HasSubstr("<wsse:Username>alice</wsse:Username>"));
  EXPECT_THAT(transport_->bodies[0], HasSubstr(">hunter2</wsse:Password>"));
  EXPECT_THAT(factory_->texts, ElementsAre(kCanonicalAssertion));
  EXPECT_THAT(factory_->tolerances, ElementsAre(600));
}

TEST_F(SecurityTokenServiceImplTest, EveryOperationHasItsOwnSession) {
  const auto service = MakeService();
  service->AcquireToken("alice", "pw", OneHour());
  service->AcquireToken("alice", "pw", OneHour());
  EXPECT_EQ(transport_->sessions, 2);
}

TEST_F(SecurityTokenServiceImplTest, AnEmptyAssertionGivesNoToken) {
  const SecurityTokenServiceImpl service(
      std::make_shared<RequestBuilderImpl>(ConfigOf(KeyCredential())), transport_,
      std::make_shared<EmptyResponseHandler>(), factory_);
  FakeSamlToken presented("<Presented ID=\"_1\"/>");
  presented.confirmationType = HOLDER_OF_KEY;
  const LogCapture log(9);
  EXPECT_EQ(service.AcquireToken("alice", "pw", OneHour()), nullptr);
  EXPECT_EQ(service.AcquireTokenByCertificate(OneHour()), nullptr);
  EXPECT_EQ(service.AcquireTokenByToken(presented, OneHour()), nullptr);
  EXPECT_EQ(service.RenewToken(presented, 60), nullptr);
  EXPECT_THAT(factory_->texts, IsEmpty());
  EXPECT_THAT(log.Lines(), Not(testing::Contains(HasSubstr("Successfully"))));
}

TEST_F(SecurityTokenServiceImplTest, AFactoryThatMakesNoTokenGivesNone) {
  factory_->makesNone = true;
  const LogCapture log(6);
  EXPECT_EQ(MakeService()->AcquireToken("alice", "pw", OneHour()), nullptr);
  EXPECT_THAT(factory_->texts, ElementsAre(kCanonicalAssertion));
  EXPECT_THAT(log.Lines(), IsEmpty());
}

TEST_F(SecurityTokenServiceImplTest, TracesTheOperation) {
  const LogCapture log(7);
  auto spec = OneHour();
  spec.audienceRestriction = {"aud"};
  const auto token = MakeService()->AcquireToken("alice", "hunter2", spec);
  EXPECT_THAT(log.Lines(),
              ElementsAre("7 START operation SecurityTokenServiceImpl::AcquireToken",
                          "7 Requested token for subject `alice', spec `" + Describe(spec) + "'",
                          "7 SecurityTokenServiceImpl::AcquireToken sending request",
                          "7 SecurityTokenServiceImpl::AcquireToken processing response",
                          "5 Successfully acquired token: " + CreateSamlTokenDescription(*token),
                          "7 END operation SecurityTokenServiceImpl::AcquireToken"));
}

TEST_F(SecurityTokenServiceImplTest, LogsOnlyTheSuccessAtLevelsFiveAndSix) {
  for (const int level : {5, 6}) {
    const LogCapture log(level);
    const auto token = MakeService()->AcquireToken("alice", "pw", OneHour());
    EXPECT_THAT(log.Lines(), ElementsAre("5 Successfully acquired token: " +
                                         CreateSamlTokenDescription(*token)));
  }
  const LogCapture log(4);
  MakeService()->AcquireToken("alice", "pw", OneHour());
  EXPECT_THAT(log.Lines(), IsEmpty());
}

TEST_F(SecurityTokenServiceImplTest, NeverLogsAPasswordOrAToken) {
  const LogCapture log(9);
  MakeService()->AcquireToken("alice", "hunter2", OneHour());
  EXPECT_THAT(log.Lines(), testing::Each(Not(HasSubstr("hunter2"))));
  EXPECT_THAT(log.Lines(), testing::Each(Not(HasSubstr("<saml2:"))));
}

TEST_F(SecurityTokenServiceImplTest, AnArgumentErrorIsThrownBeforeAnythingIsSent) {
  const LogCapture log(7);
  try {
    MakeService()->AcquireToken("alice", "pw", TokenSpec());
    FAIL();
  } catch (const Tarnik::InvalidArgumentException& error) {
    EXPECT_EQ(error.Message(), "Token lifetime must be positive");
  }
  EXPECT_EQ(transport_->sessions, 0);
  EXPECT_THAT(log.Lines(), ElementsAre("7 START operation SecurityTokenServiceImpl::AcquireToken",
                                       "7 Requested token for subject `alice', spec `" +
                                           Describe(TokenSpec()) + "'",
                                       "7 END operation SecurityTokenServiceImpl::AcquireToken"));
}

TEST_F(SecurityTokenServiceImplTest, FailuresOfTheExchangePassUnchanged) {
  transport_->failure.emplace("Server returned error: 503 Service Unavailable");
  const LogCapture log(7);
  try {
    MakeService()->AcquireToken("alice", "pw", OneHour());
    FAIL();
  } catch (const CommunicationException& error) {
    EXPECT_EQ(error.Message(), "Server returned error: 503 Service Unavailable");
  }
  EXPECT_THAT(log.Lines(), ElementsAre("7 START operation SecurityTokenServiceImpl::AcquireToken",
                                       HasSubstr("7 Requested token"),
                                       "7 SecurityTokenServiceImpl::AcquireToken sending request",
                                       "7 END operation SecurityTokenServiceImpl::AcquireToken"));
}

TEST_F(SecurityTokenServiceImplTest, RefusalsOfTheTokenFactoryPassUnchanged) {
  factory_->isRefusing = true;
  const LogCapture log(7);
  EXPECT_EQ(ThrownMessage<InvalidSignatureException>(
                [&] { MakeService()->AcquireToken("alice", "pw", OneHour()); }),
            "refused");
  EXPECT_EQ(log.Lines().back(), "7 END operation SecurityTokenServiceImpl::AcquireToken");
  EXPECT_THAT(log.Lines(), Not(testing::Contains(HasSubstr("Successfully"))));
}

class FaultedServiceTest : public SecurityTokenServiceImplTest {
 protected:
  FaultedServiceTest()
      : SecurityTokenServiceImplTest(
            Envelope(Fault("wst:FailedAuthentication", "Invalid credentials"))) {}
};

TEST_F(FaultedServiceTest, FaultsPassUnchanged) {
  try {
    MakeService()->AcquireToken("alice", "pw", OneHour());
    FAIL();
  } catch (const InvalidCredentialsException& error) {
    EXPECT_EQ(error.Message(), "Authentication failed: Invalid credentials");
  }
}

using SecurityTokenServiceImplAsyncTest = SecurityTokenServiceImplTest;

TEST_F(SecurityTokenServiceImplAsyncTest, ReportsTheToken) {
  AsyncCall call;
  MakeService()->AcquireTokenAsync("alice", "hunter2", OneHour(), call.Callback());
  const auto report = call.Wait();
  ASSERT_NE(report.token, nullptr);
  EXPECT_EQ(report.token->Xml(), kCanonicalAssertion);
  EXPECT_EQ(report.errorType, "");
  EXPECT_THAT(transport_->bodies[0], HasSubstr(">hunter2</wsse:Password>"));
}

TEST_F(SecurityTokenServiceImplAsyncTest, CopiesItsArgumentsAndOutlivesTheService) {
  AsyncCall call;
  {
    auto service = MakeService();
    std::string user = "alice";
    std::string password = "hunter2";
    auto spec = OneHour();
    service->AcquireTokenAsync(user, password, spec, call.Callback());
    service = nullptr;
    user = "mallory";
    password = "other";
    spec.tokenLifetimeSec = 0;
  }
  EXPECT_NE(call.Wait().token, nullptr);
  EXPECT_THAT(transport_->bodies[0], HasSubstr("<wsse:Username>alice</wsse:Username>"));
}

TEST_F(SecurityTokenServiceImplAsyncTest, ErrorsReachTheCallbackAndNeverTheCaller) {
  AsyncCall call;
  MakeService()->AcquireTokenAsync("alice", "pw", TokenSpec(), call.Callback());
  const auto report = call.Wait();
  EXPECT_EQ(report.token, nullptr);
  EXPECT_EQ(report.errorType, typeid(Tarnik::InvalidArgumentException).name());
  EXPECT_EQ(report.message, "Token lifetime must be positive");
}

TEST_F(SecurityTokenServiceImplAsyncTest, AnEmptyCallbackIsRefusedAtTheCall) {
  EXPECT_THROW(MakeService()->AcquireTokenAsync("alice", "pw", OneHour(), nullptr),
               Tarnik::InvalidArgumentException);
  EXPECT_EQ(transport_->sessions, 0);
}

TEST_F(SecurityTokenServiceImplTest, OperationsKeepTheirSlotOrder) {
  const auto service = MakeService();
  const SecurityTokenService* object = service.get();
  using Acquire = std::shared_ptr<const SamlToken>(const void*, const std::string&,
                                                   const std::string&, const TokenSpec&);
  EXPECT_NE(VtableSlot<Acquire>(object, 0)(object, "alice", "pw", OneHour()), nullptr);
  using AcquireAsync = void(const void*, const std::string&, const std::string&, const TokenSpec&,
                            SecurityTokenService::TokenCallback);
  AsyncCall call;
  VtableSlot<AcquireAsync>(object, 6)(object, "alice", "pw", OneHour(), call.Callback());
  EXPECT_NE(call.Wait().token, nullptr);
}

}  // namespace
}  // namespace SsoClient::Testing
