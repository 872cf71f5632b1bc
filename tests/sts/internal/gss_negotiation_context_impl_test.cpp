#include "sts/internal/gss_negotiation_context_impl.h"

#include <gmock/gmock.h>
#include <tarnik/core/exception.h>

#include <string>

#include "sts/answers.h"
#include "sts/fakes.h"
#include "sts/request_builder_impl.h"
#include "sts/response_handler_impl.h"
#include "sts/token_specs.h"
#include "support/assertion_text.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"

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

TEST(CreateGssNegotiationContextTest, JudgesWhatItReads) {
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
