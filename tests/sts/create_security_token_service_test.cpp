#include <memory>
#include <string>

#include <gmock/gmock.h>

#include <devsts/xml_security.h>
#include <ssoclient/security_token_service.h>
#include <ssoclient/security_token_service_config.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/http/http_user_agent.h>

#include "sts/answers.h"
#include "sts/fakes.h"
#include "sts/token_specs.h"
#include "support/assertion_text.h"
#include "support/holder_of_key.h"
#include "support/thrown_message.h"
#include "transport/fake_http.h"
#include "transport/fake_ssl.h"
#include "transport/loopback_server.h"
#include "transport/sso_connection_specs.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

template <class Config>
std::string ArgumentError(const Config& config) {
  try {
    CreateSecurityTokenService(config);
  } catch (const Tarnik::InvalidArgumentException& error) {
    return error.Message();
  }
  return "none";
}

constexpr char kNoKey[] = "No HolderOfKeyConfig provided. Unable to acquire token by certificate";

template <class Config>
std::string ByCertificateWithoutAKey(const Config& config) {
  return ThrownMessage<Tarnik::InvalidStateException>(
      [&] { CreateSecurityTokenService(config)->AcquireTokenByCertificate(OneHour()); });
}

class CreateSecurityTokenServiceTest : public testing::Test {
 protected:
  CreateSecurityTokenServiceTest() {
    config_.url = server_.Url("/sts/STSService");
    config_.tokenFactory = std::make_shared<FakeTokenFactory>();
  }

  LoopbackServer server_{[](const std::string&) { return OkAnswer(IssueAnswer()); }};
  SecurityTokenServiceConfig config_;
};

TEST_F(CreateSecurityTokenServiceTest, AcquiresATokenOverHttp) {
  const auto token = CreateSecurityTokenService(config_)->AcquireToken("alice", "pw", OneHour());
  ASSERT_NE(token, nullptr);
  EXPECT_EQ(token->Xml(), kCanonicalAssertion);
  ASSERT_EQ(server_.Requests().size(), 1U);
  const auto request = server_.Requests()[0];
  EXPECT_THAT(request, StartsWith("POST /sts/STSService HTTP/1.1\r\n"));
  EXPECT_THAT(request,
              HasSubstr("\r\nSOAPAction: "
                        "\"http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue\"\r\n"));
  EXPECT_THAT(request, HasSubstr("<wsse:Username>alice</wsse:Username>"));
}

TEST_F(CreateSecurityTokenServiceTest, TheFlagChangesNothing) {
  config_.flag = true;
  EXPECT_NE(CreateSecurityTokenService(config_)->AcquireToken("alice", "pw", OneHour()), nullptr);
}

TEST_F(CreateSecurityTokenServiceTest, ReadsTheConfigurationOnce) {
  const auto service = CreateSecurityTokenService(config_);
  config_ = {};
  EXPECT_NE(service->AcquireToken("alice", "pw", OneHour()), nullptr);
}

TEST_F(CreateSecurityTokenServiceTest, SignsWithTheConfiguredKeyOrNotAtAll) {
  const auto credential = KeyCredential();
  EXPECT_EQ(ByCertificateWithoutAKey(config_), kNoKey);
  config_.holderOfKeyConfig = ConfigOf(credential);
  CreateSecurityTokenService(config_)->AcquireTokenByCertificate(OneHour());
  const auto body = BodyOf(server_.Requests().at(0));
  const auto verdict = DevSts::VerifyXml(body, credential.certificatePem);
  EXPECT_TRUE(verdict.valid) << verdict.reason;
}

TEST_F(CreateSecurityTokenServiceTest, TheServiceIgnoresTheKeyInfoResolver) {
  const auto resolver = TrustedResolver();
  config_.keyInfoResolver = resolver.get();
  const auto service = CreateSecurityTokenService(config_);
  EXPECT_EQ(resolver->RefCount(), 1);
  // The token in the answer is not signed.
  EXPECT_NE(service->AcquireToken("alice", "pw", OneHour()), nullptr);
}

TEST_F(CreateSecurityTokenServiceTest, HttpsNeedsAnSslContext) {
  config_.url = "https://127.0.0.1:" + std::to_string(server_.Port()) + "/";
  EXPECT_EQ(ArgumentError(config_), "HTTPS connection requested but no SSLContext provided.");
}

TEST_F(CreateSecurityTokenServiceTest, PassesTheTlsValuesOn) {
  const auto context = Tarnik::MakeRef<FakeSslContext>();
  config_.url = "https://127.0.0.1:" + std::to_string(server_.Port()) + "/";
  config_.sslContext = context.get();
  config_.sslPeerName = "sts.example";
  EXPECT_NE(CreateSecurityTokenService(config_)->AcquireToken("alice", "pw", OneHour()), nullptr);
  EXPECT_EQ(context->serverName, "sts.example");
  EXPECT_EQ(context->host, "127.0.0.1");
}

TEST_F(CreateSecurityTokenServiceTest, MalformedUrlsAreRefused) {
  config_.url = "nowhere";
  EXPECT_NE(ArgumentError(config_), "none");
}

TEST_F(CreateSecurityTokenServiceTest, ATokenFactoryIsNeeded) {
  config_.tokenFactory = nullptr;
  EXPECT_EQ(ArgumentError(config_), "The token factory must not be null.");
}

class CreateSecurityTokenServiceExTest : public CreateSecurityTokenServiceTest {
 protected:
  CreateSecurityTokenServiceExTest() {
    agent_->onWait = [] { return Tarnik::MakeRef<FakeResponse>(200, "OK", IssueAnswer()); };
    configEx_.url = "/used/unchanged";
    configEx_.userAgent = agent_;
    configEx_.tokenFactory = config_.tokenFactory;
  }

  Tarnik::Ref<FakeUserAgent> agent_ = Tarnik::MakeRef<FakeUserAgent>();
  SecurityTokenServiceConfigEx configEx_;
};

TEST_F(CreateSecurityTokenServiceExTest, SendsThroughTheCallersAgentFor240Seconds) {
  const auto service = CreateSecurityTokenService(configEx_);
  EXPECT_NE(service->AcquireToken("alice", "pw", OneHour()), nullptr);
  EXPECT_NE(service->AcquireToken("alice", "pw", OneHour()), nullptr);
  EXPECT_THAT(agent_->waitTimeouts, testing::ElementsAre(240'000'000UL, 240'000'000UL));
}

TEST_F(CreateSecurityTokenServiceExTest, SignsWithTheConfiguredKeyOrNotAtAll) {
  EXPECT_EQ(ByCertificateWithoutAKey(configEx_), kNoKey);
  configEx_.holderOfKeyConfig = ConfigOf(KeyCredential());
  EXPECT_NE(CreateSecurityTokenService(configEx_)->AcquireTokenByCertificate(OneHour()), nullptr);
}

TEST_F(CreateSecurityTokenServiceExTest, UsesTheUrlAsTheRequestTarget) {
  Tarnik::Ref<Tarnik::Http::ConnectionSpec> spec;
  CreateSsoConnectionSpec("127.0.0.1", server_.Port(), false, spec);
  configEx_.userAgent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  configEx_.url = "http://proxied.example/sts";
  EXPECT_NE(CreateSecurityTokenService(configEx_)->AcquireToken("alice", "pw", OneHour()), nullptr);
  ASSERT_EQ(server_.Requests().size(), 1U);
  EXPECT_THAT(server_.Requests()[0], StartsWith("POST http://proxied.example/sts HTTP/1.1\r\n"));
}

TEST_F(CreateSecurityTokenServiceExTest, AnAgentAndATokenFactoryAreNeeded) {
  configEx_.userAgent = nullptr;
  EXPECT_EQ(ArgumentError(configEx_), "The HTTP user agent must not be null.");
  configEx_.tokenFactory = nullptr;
  EXPECT_EQ(ArgumentError(configEx_), "The token factory must not be null.");
}

}  // namespace
}  // namespace SsoClient::Testing
