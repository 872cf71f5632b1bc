// Secrets of a login do not remain in released memory.
#include <memory>
#include <numeric>
#include <string>
#include <vector>

#include <boost/none.hpp>
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/negotiation_handler.h>
#include <tarnik/text/string_util.h>

#include "calls/freed_memory.h"
#include "sts/answers.h"
#include "sts/fakes.h"
#include "sts/internal/gss_negotiation_context_impl.h"
#include "sts/request_builder.h"
#include "sts/response_handler.h"
#include "sts/security_token_service_impl.h"
#include "sts/token_specs.h"
#include "support/assertion_text.h"

namespace SsoClient::Testing {
namespace {

using Leg = std::vector<unsigned char>;

Leg LongLeg() {
  Leg leg(600);
  std::iota(leg.begin(), leg.end(), static_cast<unsigned char>(0));
  return leg;
}

std::string PartOf(const std::string& text) {
  return text.substr(text.size() / 2, 40);
}

/// The leg as it is, or in Base64.
class FreedLegTest : public testing::TestWithParam<bool> {
 protected:
  std::string Needle() const {
    return PartOf(GetParam() ? Tarnik::StringUtil::Base64Encode(leg_)
                             : std::string(leg_.begin(), leg_.end()));
  }

  const Leg leg_ = LongLeg();
  const RequestBuilderImpl builder_{boost::none};
};

TEST_P(FreedLegTest, LeftoversAreDetected) {
  const FreedMemory memory(Needle());
  const auto copy = [this] {
    return GetParam() ? Tarnik::StringUtil::Base64Encode(leg_)
                      : std::string(leg_.begin(), leg_.end());
  };
  EXPECT_GT(copy().size(), 0U);
  EXPECT_EQ(memory.Finds(), 1);
}

TEST_P(FreedLegTest, IsNotLeftByARequestThatBeginsANegotiation) {
  const FreedMemory memory(Needle());
  {
    SoapRequest request;
    builder_.BuildInitialNegotiationRequest(OneHour(), leg_, request);
  }
  EXPECT_EQ(memory.Finds(), 0);
}

TEST_P(FreedLegTest, IsNotLeftByARequestThatContinuesANegotiation) {
  const FreedMemory memory(Needle());
  {
    SoapRequest request;
    builder_.BuildContinuedNegotiationRequest("urn:context", leg_, request);
  }
  EXPECT_EQ(memory.Finds(), 0);
}

INSTANTIATE_TEST_SUITE_P(Forms, FreedLegTest, testing::Bool(),
                         [](const auto& test) { return test.param ? "Base64" : "Bytes"; });

/// Markup that occurs only in the text of a token.
constexpr char kTokenMarkup[] = "</saml2:Issuer><";

TEST(FreedTokenTest, IsNotLeftByANegotiationContext) {
  const auto transport =
      std::make_shared<FakeTransport>(LastLegAnswer(AssertionText().ToXml(), kLeg));
  InternalApi::GssNegotiationContextImpl context(
      OneHour(), std::make_shared<RequestBuilderImpl>(boost::none), transport->CreateSession(),
      std::make_shared<ResponseHandlerImpl>(), nullptr);
  const FreedMemory memory(kTokenMarkup);
  auto result = context.Negotiate({1});
  ASSERT_NE(result.token, nullptr);
  EXPECT_NE(result.token->Xml().find(kTokenMarkup), std::string::npos);
  EXPECT_EQ(memory.Finds(), 0);
  result.token = nullptr;
  EXPECT_EQ(memory.Finds(), 0);
}

class QuietHandler final : public NegotiationHandler {
 public:
  std::shared_ptr<const Leg> Negotiate(const Leg&) override {
    return std::make_shared<const Leg>();
  }
};

TEST(FreedTokenTest, IsNotLeftByAnAnswerWithoutAContext) {
  const auto transport =
      std::make_shared<FakeTransport>(LastLegAnswer(AssertionText().ToXml(), {}, ""));
  const SecurityTokenServiceImpl service(std::make_shared<RequestBuilderImpl>(boost::none),
                                         transport, std::make_shared<ResponseHandlerImpl>(),
                                         std::make_shared<FakeTokenFactory>());
  QuietHandler handler;
  const FreedMemory memory(kTokenMarkup);
  EXPECT_THROW(service.AcquireTokenByGSS(OneHour(), handler), CommunicationException);
  EXPECT_EQ(memory.Finds(), 0);
}

}  // namespace
}  // namespace SsoClient::Testing
