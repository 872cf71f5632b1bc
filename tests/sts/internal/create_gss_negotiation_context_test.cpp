#include <cstddef>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include <devsts/xml_security.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/gss_negotiation_context.h>
#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/security_token_service_config.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>

#include "sts/answers.h"
#include "sts/token_specs.h"
#include "support/assertion_text.h"
#include "support/holder_of_key.h"
#include "transport/fake_ssl.h"
#include "transport/loopback_server.h"

namespace SsoClient::Testing {
namespace {

using namespace InternalApi;
using testing::ElementsAre;
using testing::HasSubstr;
using testing::Not;

class CreateGssNegotiationContextTest : public testing::Test {
 protected:
  static std::vector<unsigned char> Leg(GssNegotiationContext& context) {
    return *context.Negotiate({7}).outputLeg;
  }

  std::string answer_ = LegAnswer("c");
  LoopbackServer server_{
      [this](const std::string&) { return OkAnswer(answer_, "Set-Cookie: leg=1; Path=/\r\n"); }};
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

TEST_F(CreateGssNegotiationContextTest, PassesTheTlsValuesOn) {
  const auto sslContext = Tarnik::MakeRef<FakeSslContext>();
  SecurityTokenServiceConfig config;
  config.url = "https://127.0.0.1:" + std::to_string(server_.Port()) + "/";
  config.sslContext = sslContext.get();
  config.sslPeerName = "sts.example";
  Leg(*CreateGssNegotiationContext(config, OneHour()));
  EXPECT_EQ(sslContext->host, "127.0.0.1");
  EXPECT_EQ(sslContext->serverName, "sts.example");
}

TEST_F(CreateGssNegotiationContextTest, SignsTheFirstLegWithTheConfiguredKey) {
  const auto credential = KeyCredential();
  SecurityTokenServiceConfig config;
  config.url = server_.Url("/");
  config.holderOfKeyConfig = ConfigOf(credential);
  Leg(*CreateGssNegotiationContext(config, OneHour()));
  const auto body = BodyOf(server_.Requests().at(0));
  const auto verdict = DevSts::VerifyXml(body, credential.certificatePem);
  EXPECT_TRUE(verdict.valid) << verdict.reason;
}

TEST_F(CreateGssNegotiationContextTest, VerifiesTheTokenWithTheConfiguredResolver) {
  const auto resolver = TrustedResolver();
  SecurityTokenServiceConfig config;
  config.url = server_.Url("/");
  config.keyInfoResolver = resolver.get();
  const AssertionText text;
  answer_ = LastLegAnswer(text.ToSignedXml(StrangerCredential()));
  EXPECT_THROW(CreateGssNegotiationContext(config, OneHour())->Negotiate({7}),
               InvalidSignatureException);
  answer_ = LastLegAnswer(text.ToSignedXml(TrustedCredential()));
  EXPECT_NE(CreateGssNegotiationContext(config, OneHour())->Negotiate({7}).token, nullptr);
}

TEST_F(CreateGssNegotiationContextTest, AContextHoldsWhatItUsesAndReleasesIt) {
  const auto resolver = TrustedResolver();
  const auto sslContext = Tarnik::MakeRef<FakeSslContext>();
  SecurityTokenServiceConfig config;
  config.url = "https://sts.example/";
  config.sslContext = sslContext.get();
  config.keyInfoResolver = resolver.get();
  config.holderOfKeyConfig = ConfigOf(KeyCredential());
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

TEST_F(CreateGssNegotiationContextTest, ChecksTheConfiguration) {
  SecurityTokenServiceConfig config;
  config.url = "https://sts.example/";
  EXPECT_THROW(CreateGssNegotiationContext(config, OneHour()), Tarnik::InvalidArgumentException);
  config.url = "http://sts.example/";
  EXPECT_NE(CreateGssNegotiationContext(config, OneHour()), nullptr);
  config.holderOfKeyConfig = HolderOfKeyConfig();
  EXPECT_THROW(CreateGssNegotiationContext(config, OneHour()), Tarnik::InvalidArgumentException);
}

}  // namespace
}  // namespace SsoClient::Testing
