#include "sts/internal/gss_negotiation_context_impl.h"

#include <memory>
#include <string>
#include <utility>
#include <vector>

#include <boost/none.hpp>
#include <gmock/gmock.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "sts/answers.h"
#include "sts/fakes.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "sts/token_specs.h"
#include "support/assertion_text.h"
#include "support/fake_saml_token.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"

namespace SsoClient::Testing {
namespace {

using namespace InternalApi;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::Not;

class GssNegotiationContextImplTest : public testing::Test {
 protected:
  void Answer(std::vector<std::string> answers, const TokenSpec& spec = OneHour(),
              const Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver>& resolver = nullptr) {
    transport_ = std::make_shared<FakeTransport>(std::move(answers));
    context_ = std::make_shared<GssNegotiationContextImpl>(
        spec, std::make_shared<RequestBuilderImpl>(boost::none), transport_->CreateSession(),
        std::make_shared<ResponseHandlerImpl>(), resolver);
  }

  std::shared_ptr<FakeTransport> transport_;
  std::shared_ptr<GssNegotiationContext> context_;
};

TEST_F(GssNegotiationContextImplTest, TheFirstLegHasTheSpecAndTheSecondTheContext) {
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
  Answer({LastLegAnswer(AssertionText().ToXml())});
  const auto result = context_->Negotiate({7});
  ASSERT_NE(result.outputLeg, nullptr);
  EXPECT_THAT(*result.outputLeg, IsEmpty());
  EXPECT_NE(result.token, nullptr);
}

TEST_F(GssNegotiationContextImplTest, ATokenMayComeWithALeg) {
  Answer({LastLegAnswer(AssertionText().ToXml(), kLeg)});
  const auto result = context_->Negotiate({7});
  EXPECT_THAT(*result.outputLeg, ElementsAre(1, 2, 3));
  EXPECT_NE(result.token, nullptr);
}

// A token expires one hour after the time given to its text.
TEST_F(GssNegotiationContextImplTest, ATokenIsCheckedWithTenMinutesOfTolerance) {
  const auto answerEndedBefore = [](long seconds) {
    const auto now = Tarnik::System::GetUtcDateTime().GetUtcTime();
    return LastLegAnswer(
        AssertionText(Tarnik::System::DateTimeFromUtc(now - (3600 + seconds) * 1'000'000, false))
            .ToXml());
  };
  Answer({answerEndedBefore(570), answerEndedBefore(601)});
  EXPECT_NE(context_->Negotiate({7}).token, nullptr);
  EXPECT_THROW(context_->Negotiate({8}), InvalidTokenException);
}

TEST_F(GssNegotiationContextImplTest, ATokenIsVerifiedWithTheResolver) {
  const auto text = AssertionText();
  Answer({LastLegAnswer(text.ToSignedXml(TrustedCredential()))}, OneHour(), TrustedResolver());
  EXPECT_NE(context_->Negotiate({7}).token, nullptr);
}

TEST_F(GssNegotiationContextImplTest, ARefusedTokenStillSetsTheContext) {
  const auto text = AssertionText();
  Answer({LastLegAnswer(text.ToSignedXml(StrangerCredential()))}, OneHour(), TrustedResolver());
  EXPECT_THROW(context_->Negotiate({7}), InvalidSignatureException);
  EXPECT_THROW(context_->Negotiate({8}), InvalidSignatureException);
  EXPECT_THAT(transport_->bodies[1], HasSubstr("Context=\"c\""));
}

TEST_F(GssNegotiationContextImplTest, EachLegHasTheContextOfTheAnswerBeforeIt) {
  Answer({LegAnswer("c1"), LegAnswer("c2"), LegAnswer("c3")});
  context_->Negotiate({7});
  context_->Negotiate({8});
  context_->Negotiate({9});
  EXPECT_THAT(transport_->bodies[1], HasSubstr("Context=\"c1\""));
  EXPECT_THAT(transport_->bodies[2], HasSubstr("Context=\"c2\""));
}

TEST_F(GssNegotiationContextImplTest, AnEmptyContextStartsANewNegotiation) {
  Answer({LegAnswer("")});
  context_->Negotiate({7});
  context_->Negotiate({8});
  EXPECT_THAT(transport_->bodies[1], HasSubstr("<wst:Lifetime"));
}

TEST_F(GssNegotiationContextImplTest, AFailedExchangeKeepsThePreviousContext) {
  Answer({LegAnswer("c1")});
  context_->Negotiate({7});
  transport_->failure.emplace("timed out");
  EXPECT_EQ(ThrownMessage<CommunicationException>([&] { context_->Negotiate({8}); }), "timed out");
  transport_->failure.reset();
  context_->Negotiate({9});
  EXPECT_THAT(transport_->bodies[2], HasSubstr("Context=\"c1\""));
}

TEST_F(GssNegotiationContextImplTest, AFaultKeepsThePreviousContext) {
  Answer({LegAnswer("c1"), Envelope(Fault("wst:FailedAuthentication", "no")), LegAnswer("c2")});
  context_->Negotiate({7});
  EXPECT_EQ(ThrownMessage<InvalidCredentialsException>([&] { context_->Negotiate({8}); }),
            "Authentication failed: no");
  context_->Negotiate({9});
  EXPECT_THAT(transport_->bodies[2], HasSubstr("Context=\"c1\""));
}

TEST_F(GssNegotiationContextImplTest, TheSpecIsCheckedWithTheFirstLeg) {
  Answer({LegAnswer("c")}, TokenSpec());
  EXPECT_EQ(ThrownMessage<Tarnik::InvalidArgumentException>([&] { context_->Negotiate({7}); }),
            "Token lifetime must be positive");
  EXPECT_THAT(transport_->bodies, IsEmpty());
}

TEST_F(GssNegotiationContextImplTest, ALegAfterTheTokenContinuesWithTheLastContext) {
  Answer({LastLegAnswer(AssertionText().ToXml())});
  context_->Negotiate({7});
  context_->Negotiate({8});
  EXPECT_THAT(transport_->bodies[1], HasSubstr("Context=\"c\""));
}

TEST_F(GssNegotiationContextImplTest, NegotiateIsTheOnlySlot) {
  Answer({LegAnswer("c")});
  using Negotiate = GssNegotiationResult(const void*, const std::vector<unsigned char>&);
  const auto result = VtableSlot<Negotiate>(context_.get(), 0)(context_.get(), {7});
  EXPECT_THAT(*result.outputLeg, ElementsAre(1, 2, 3));
  EXPECT_THAT(transport_->bodies[0], HasSubstr(">Bw==</wst:BinaryExchange>"));
}

// A static cast from a virtual base to a derived class is ill-formed.
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
  const auto token = std::make_shared<const FakeSamlToken>("<a/>");
  const GssNegotiationResult result{leg, token};
  EXPECT_EQ(result.outputLeg, leg);
  EXPECT_EQ(result.token, token);
}

}  // namespace
}  // namespace SsoClient::Testing
