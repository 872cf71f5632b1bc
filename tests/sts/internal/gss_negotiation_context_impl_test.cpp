#include "sts/internal/gss_negotiation_context_impl.h"

#include <devsts/xml_security.h>
#include <gmock/gmock.h>
#include <tarnik/core/exception.h>

#include <string>

#include "sts/answers.h"
#include "sts/fakes.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "sts/token_specs.h"
#include "support/assertion_text.h"
#include "support/fake_saml_token.h"
#include "support/holder_of_key.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"
#include "transport/fake_ssl.h"
#include "transport/loopback_server.h"

namespace SsoClient::InternalApi {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using Testing::LastLegAnswer;
using Testing::LegAnswer;
using testing::Not;
using Testing::OneHour;
using TestSupport::ThrownMessage;

class GssNegotiationContextImplTest : public testing::Test {
 protected:
  void Answer(std::vector<std::string> answers, const TokenSpec& spec = OneHour(),
              const Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver>& resolver = nullptr) {
    transport_ = std::make_shared<Testing::FakeTransport>(std::move(answers));
    context_ = std::make_shared<GssNegotiationContextImpl>(
        spec, std::make_shared<RequestBuilderImpl>(boost::none), transport_->CreateSession(),
        std::make_shared<ResponseHandlerImpl>(), resolver);
  }

  std::shared_ptr<Testing::FakeTransport> transport_;
  std::shared_ptr<GssNegotiationContext> context_;
};

TEST_F(GssNegotiationContextImplTest, TheFirstLegCarriesTheSpecAndTheSecondTheContext) {
  Answer({LegAnswer("c1"), LegAnswer("c2")});
  const auto first = context_->Negotiate({7});
  ASSERT_NE(first.outputLeg, nullptr);
  EXPECT_THAT(*first.outputLeg, ElementsAre(1, 2, 3));
  EXPECT_EQ(first.token, nullptr);
  context_->Negotiate({8});
  EXPECT_EQ(transport_->sessions, 1);
  EXPECT_THAT(transport_->actions,
              ElementsAre("http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue",
                          "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Issue"));
  EXPECT_THAT(transport_->bodies[0], HasSubstr("<wst:Lifetime"));
  EXPECT_THAT(transport_->bodies[0], HasSubstr(">Bw==</wst:BinaryExchange>"));
  EXPECT_THAT(transport_->bodies[1],
              HasSubstr("<wst:RequestSecurityTokenResponse Context=\"c1\">"));
  EXPECT_THAT(transport_->bodies[1], Not(HasSubstr("<wst:Lifetime")));
}

TEST_F(GssNegotiationContextImplTest, ATokenWithoutALegGivesAnEmptyPresentLeg) {
  Answer({LastLegAnswer(TestSupport::AssertionText().ToXml())});
  const auto result = context_->Negotiate({7});
  ASSERT_NE(result.outputLeg, nullptr);
  EXPECT_THAT(*result.outputLeg, IsEmpty());
  EXPECT_NE(result.token, nullptr);
}

TEST_F(GssNegotiationContextImplTest, ATokenMayComeWithALeg) {
  Answer({LastLegAnswer(TestSupport::AssertionText().ToXml(), Testing::kLeg)});
  const auto result = context_->Negotiate({7});
  EXPECT_THAT(*result.outputLeg, ElementsAre(1, 2, 3));
  EXPECT_NE(result.token, nullptr);
}

// Tokens end one hour after the time that they are made for.
TEST_F(GssNegotiationContextImplTest, ATokenIsJudgedWithTenMinutesForTheClocks) {
  const auto answerEndedBefore = [](long seconds) {
    const auto now = Tarnik::System::GetUtcDateTime().GetUtcTime();
    return LastLegAnswer(TestSupport::AssertionText(Tarnik::System::DateTimeFromUtc(
                                                        now - (3600 + seconds) * 1'000'000, false))
                             .ToXml());
  };
  Answer({answerEndedBefore(570), answerEndedBefore(601)});
  EXPECT_NE(context_->Negotiate({7}).token, nullptr);
  EXPECT_THROW(context_->Negotiate({8}), InvalidTokenException);
}

TEST_F(GssNegotiationContextImplTest, ATokenIsVerifiedWithTheResolver) {
  const auto text = TestSupport::AssertionText();
  Answer({LastLegAnswer(text.ToSignedXml(TestSupport::TrustedCredential()))}, OneHour(),
         TestSupport::TrustedResolver());
  EXPECT_NE(context_->Negotiate({7}).token, nullptr);
}

TEST_F(GssNegotiationContextImplTest, ARefusedTokenHasNamedTheNegotiationAllTheSame) {
  const auto text = TestSupport::AssertionText();
  Answer({LastLegAnswer(text.ToSignedXml(TestSupport::StrangerCredential()))}, OneHour(),
         TestSupport::TrustedResolver());
  EXPECT_THROW(context_->Negotiate({7}), InvalidSignatureException);
  EXPECT_THROW(context_->Negotiate({8}), InvalidSignatureException);
  EXPECT_THAT(transport_->bodies[1], HasSubstr("Context=\"c\""));
}

TEST_F(GssNegotiationContextImplTest, AnEmptyContextStartsANewNegotiation) {
  Answer({LegAnswer("")});
  context_->Negotiate({7});
  context_->Negotiate({8});
  EXPECT_THAT(transport_->bodies[1], HasSubstr("<wst:Lifetime"));
}

TEST_F(GssNegotiationContextImplTest, AFailedExchangeKeepsTheContextOfTheLegBefore) {
  Answer({LegAnswer("c1")});
  context_->Negotiate({7});
  transport_->failure.emplace("timed out");
  EXPECT_EQ(ThrownMessage<CommunicationException>([&] { context_->Negotiate({8}); }), "timed out");
  transport_->failure.reset();
  context_->Negotiate({9});
  EXPECT_THAT(transport_->bodies[2], HasSubstr("Context=\"c1\""));
}

TEST_F(GssNegotiationContextImplTest, AFaultKeepsTheContextOfTheLegBefore) {
  Answer({LegAnswer("c1"), Testing::Envelope(Testing::Fault("wst:FailedAuthentication", "no")),
          LegAnswer("c2")});
  context_->Negotiate({7});
  EXPECT_EQ(ThrownMessage<InvalidCredentialsException>([&] { context_->Negotiate({8}); }),
            "Authentication failed: no");
  context_->Negotiate({9});
  EXPECT_THAT(transport_->bodies[2], HasSubstr("Context=\"c1\""));
}

TEST_F(GssNegotiationContextImplTest, TheSpecIsJudgedWithTheFirstLeg) {
  Answer({LegAnswer("c")}, TokenSpec());
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>([&] { context_->Negotiate({7}); }),
            "Token lifetime must be positive");
  EXPECT_THAT(transport_->bodies, IsEmpty());
}

TEST_F(GssNegotiationContextImplTest, ALegAfterTheTokenContinuesWithTheLastContext) {
  Answer({LastLegAnswer(TestSupport::AssertionText().ToXml())});
  context_->Negotiate({7});
  context_->Negotiate({8});
  EXPECT_THAT(transport_->bodies[1], HasSubstr("Context=\"c\""));
}

TEST_F(GssNegotiationContextImplTest, NegotiateIsTheOneSlot) {
  Answer({LegAnswer("c")});
  using Negotiate = GssNegotiationResult(const void*, const std::vector<unsigned char>&);
  const auto result = TestSupport::VtableSlot<Negotiate>(context_.get(), 0)(context_.get(), {7});
  EXPECT_THAT(*result.outputLeg, ElementsAre(1, 2, 3));
  EXPECT_THAT(transport_->bodies[0], HasSubstr(">Bw==</wst:BinaryExchange>"));
}

// No static cast leads down from a virtual base.
template <class Base, class Derived>
constexpr bool kCastsDown = requires(Base* base) {
  static_cast<Derived*>(base);
};

TEST(GssNegotiationContextTypesTest, TheInterfaceIsAVirtualBase) {
  EXPECT_FALSE((kCastsDown<GssNegotiationContext, GssNegotiationContextImpl>));
  EXPECT_TRUE((kCastsDown<RequestBuilder, RequestBuilderImpl>));
}

TEST(GssNegotiationContextTypesTest, AResultHoldsItsFieldsInOrder) {
  const auto leg = std::make_shared<std::vector<unsigned char>>();
  const auto token = std::make_shared<const Testing::FakeSamlToken>("<a/>");
  const GssNegotiationResult result{leg, token};
  EXPECT_EQ(result.outputLeg, leg);
  EXPECT_EQ(result.token, token);
}

class CreateGssNegotiationContextTest : public testing::Test {
 protected:
  static std::vector<unsigned char> Leg(GssNegotiationContext& context) {
    return *context.Negotiate({7}).outputLeg;
  }

  std::string answer_ = LegAnswer("c");
  Testing::LoopbackServer server_{[this](const std::string&) {
    return Testing::OkAnswer(answer_, "Set-Cookie: leg=1; Path=/\r\n");
  }};
};

TEST_F(CreateGssNegotiationContextTest, ReadsTheConfigurationAndTheSpecOnce) {
  SecurityTokenServiceConfig config;
  config.url = server_.Url("/sts/STSService");
  auto spec = OneHour();
  const auto context = CreateGssNegotiationContext(config, spec);
  config.url = "gone";
  spec.tokenLifetimeSec = 0;
  EXPECT_THAT(Leg(*context), ElementsAre(1, 2, 3));
  const auto request = server_.Requests().at(0);
  EXPECT_THAT(request, testing::StartsWith("POST /sts/STSService HTTP/1.1\r\n"));
  EXPECT_THAT(request, Not(HasSubstr("ds:Signature")));
}

TEST_F(CreateGssNegotiationContextTest, CookiesTravelFromLegToLeg) {
  SecurityTokenServiceConfig config;
  config.url = server_.Url("/");
  const auto context = CreateGssNegotiationContext(config, OneHour());
  Leg(*context);
  Leg(*context);
  const auto requests = server_.Requests();
  ASSERT_EQ(requests.size(), 2U);
  EXPECT_THAT(requests[0], Not(HasSubstr("Cookie:")));
  EXPECT_THAT(requests[1], HasSubstr("\r\nCookie: leg=1\r\n"));
}

TEST_F(CreateGssNegotiationContextTest, HandsTheTlsValuesOn) {
  const auto sslContext = Tarnik::MakeRef<Testing::FakeSslContext>();
  SecurityTokenServiceConfig config;
  config.url = "https://127.0.0.1:" + std::to_string(server_.Port()) + "/";
  config.sslContext = sslContext.get();
  config.sslPeerName = "sts.example";
  Leg(*CreateGssNegotiationContext(config, OneHour()));
  EXPECT_EQ(sslContext->host, "127.0.0.1");
  EXPECT_EQ(sslContext->serverName, "sts.example");
}

TEST_F(CreateGssNegotiationContextTest, SignsTheFirstLegWithTheConfiguredKey) {
  const auto credential = Testing::KeyCredential();
  SecurityTokenServiceConfig config;
  config.url = server_.Url("/");
  config.holderOfKeyConfig = Testing::ConfigOf(credential);
  Leg(*CreateGssNegotiationContext(config, OneHour()));
  const auto body = Testing::BodyOf(server_.Requests().at(0));
  const auto verdict = DevSts::VerifyXml(body, credential.certificatePem);
  EXPECT_TRUE(verdict.valid) << verdict.reason;
}

TEST_F(CreateGssNegotiationContextTest, VerifiesTheTokenWithTheConfiguredResolver) {
  const auto resolver = TestSupport::TrustedResolver();
  SecurityTokenServiceConfig config;
  config.url = server_.Url("/");
  config.keyInfoResolver = resolver.get();
  const TestSupport::AssertionText text;
  answer_ = LastLegAnswer(text.ToSignedXml(TestSupport::StrangerCredential()));
  EXPECT_THROW(CreateGssNegotiationContext(config, OneHour())->Negotiate({7}),
               InvalidSignatureException);
  answer_ = LastLegAnswer(text.ToSignedXml(TestSupport::TrustedCredential()));
  EXPECT_NE(CreateGssNegotiationContext(config, OneHour())->Negotiate({7}).token, nullptr);
}

TEST_F(CreateGssNegotiationContextTest, AContextHoldsWhatItUsesAndReleasesIt) {
  const auto resolver = TestSupport::TrustedResolver();
  const auto sslContext = Tarnik::MakeRef<Testing::FakeSslContext>();
  SecurityTokenServiceConfig config;
  config.url = "https://sts.example/";
  config.sslContext = sslContext.get();
  config.keyInfoResolver = resolver.get();
  config.holderOfKeyConfig = Testing::ConfigOf(Testing::KeyCredential());
  const auto counts = [&] {
    return std::vector<long>{
        resolver->RefCount(), config.holderOfKeyConfig->certificate->RefCount(),
        config.holderOfKeyConfig->privateKey->RefCount(), sslContext->RefCount()};
  };
  const auto before = counts();
  auto context = CreateGssNegotiationContext(config, OneHour());
  const auto meanwhile = counts();
  for (std::size_t i = 0; i < before.size(); ++i) {
    EXPECT_EQ(meanwhile[i], before[i] + 1) << i;
  }
  context = nullptr;
  EXPECT_EQ(counts(), before);
}

TEST_F(CreateGssNegotiationContextTest, JudgesWhatItReads) {
  SecurityTokenServiceConfig config;
  config.url = "https://sts.example/";
  EXPECT_THROW(CreateGssNegotiationContext(config, OneHour()), Tarnik::InvalidArgumentException);
  config.url = "http://sts.example/";
  EXPECT_NE(CreateGssNegotiationContext(config, OneHour()), nullptr);
  config.holderOfKeyConfig = HolderOfKeyConfig();
  EXPECT_THROW(CreateGssNegotiationContext(config, OneHour()), Tarnik::InvalidArgumentException);
}

}  // namespace
}  // namespace SsoClient::InternalApi
