#include <string>

#include <gmock/gmock.h>
#include <netinet/in.h>
#include <sys/socket.h>
#include <unistd.h>

#include "integration/sts_fixture.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;
using testing::StartsWith;

class RefusalTest : public StsTest {
 protected:
  static std::string CommunicationFailure() {
    return MessageOf<CommunicationException>([] { Acquire(); });
  }
};

TEST_F(RefusalTest, WrongPasswordIsInvalidCredentials) {
  const std::string message = MessageOf<InvalidCredentialsException>(
      [] { Service()->AcquireToken(kUser, "wrong-secret", TenMinutes()); });
  EXPECT_EQ(message, "Authentication failed: Invalid credentials");
}

TEST_F(RefusalTest, UnknownUserIsInvalidCredentials) {
  const std::string message = MessageOf<InvalidCredentialsException>(
      [] { Service()->AcquireToken("nobody@EXAMPLE.COM", kPassword, TenMinutes()); });
  EXPECT_EQ(message, "Authentication failed: Invalid credentials");
}

TEST_F(RefusalTest, ExpiredPasswordHasItsOwnException) {
  const std::string message = MessageOf<PasswordExpiredException>(
      [] { Service()->AcquireToken("expired@EXAMPLE.COM", "expired-secret", TenMinutes()); });
  EXPECT_THAT(message,
              StartsWith("Authentication failed: Password of the user logging on is expired"));
}

TEST_F(RefusalTest, ExpiryTextAfterOtherWordsIsNotAnExpiredPassword) {
  DevSts::Misbehavior misbehavior;
  misbehavior.fault =
      DevSts::FaultAnswer{kTrust, "FailedAuthentication",
                          "Sorry. Password of the user logging on is expired", false, 500};
  Sts().SetMisbehavior(misbehavior);
  EXPECT_EQ(MessageOf<InvalidCredentialsException>([] { Acquire(); }),
            "Authentication failed: Sorry. Password of the user logging on is expired");
}

TEST_F(RefusalTest, InvalidSecurityTokenWithoutFaultstringHasNoColon) {
  for (const char* codeNamespace : {kTrust, kSecext}) {
    DevSts::Misbehavior misbehavior;
    misbehavior.fault = DevSts::FaultAnswer{codeNamespace, "InvalidSecurityToken", "", true, 500};
    Sts().SetMisbehavior(misbehavior);
    EXPECT_EQ(MessageOf<InvalidCredentialsException>([] { Acquire(); }), "Authentication failed");
  }
}

TEST_F(RefusalTest, FaultCodeWithoutPrefixIsUnexpected) {
  DevSts::Misbehavior misbehavior;
  misbehavior.fault = DevSts::FaultAnswer{"", "FailedAuthentication", "no", false, 500};
  Sts().SetMisbehavior(misbehavior);
  EXPECT_EQ(MessageOf<SsoException>([] { Acquire(); }),
            "Unexpected SOAP fault: FailedAuthentication; request failed.");
}

// A SOAP 1.1 answer with this attribute on its Envelope.
DevSts::Misbehavior AnswerWith(int status, const std::string& attribute, const std::string& body) {
  DevSts::Misbehavior misbehavior;
  misbehavior.httpAnswer =
      DevSts::HttpAnswer{status,
                         status == 200 ? "OK" : "Internal Server Error",
                         {},
                         R"(<S:Envelope xmlns:S="http://schemas.xmlsoap.org/soap/envelope/" )" +
                             attribute + "><S:Body>" + body + "</S:Body></S:Envelope>"};
  return misbehavior;
}

TEST_F(RefusalTest, FaultCodeWithUndeclaredPrefixIsAParseException) {
  const std::string fault = "<S:Fault><faultcode>no:Such</faultcode></S:Fault>";
  Sts().SetMisbehavior(AnswerWith(500, "", fault));
  EXPECT_THAT(MessageOf<ParseException>([] { Acquire(); }),
              HasSubstr("uses undefined prefix: `no'"));
  Sts().SetMisbehavior(AnswerWith(500, R"(xmlns:no="urn:no")", fault));
  EXPECT_EQ(MessageOf<SsoException>([] { Acquire(); }),
            "Unexpected SOAP fault: no:Such; request failed.");
}

TEST_F(RefusalTest, AssertionInScopeOfARelativeNamespaceIsAnXmlSecurityException) {
  const std::string body =
      "<RequestSecurityTokenResponseCollection><RequestSecurityTokenResponse>"
      "<RequestedSecurityToken><Assertion/></RequestedSecurityToken>"
      "</RequestSecurityTokenResponse></RequestSecurityTokenResponseCollection>";
  Sts().SetMisbehavior(AnswerWith(200, R"(xmlns:r="relative")", body));
  EXPECT_THAT(MessageOf<Tarnik::Xml::Security::XmlSecurityException>([] { Acquire(); }),
              HasSubstr("relative"));
  Sts().SetMisbehavior(AnswerWith(200, R"(xmlns:r="urn:absolute")", body));
  MessageOf<ParseException>([] { Acquire(); });  // the assertion is empty
}

TEST_F(RefusalTest, FaultIsReadWithAnySuccessStatus) {
  DevSts::Misbehavior misbehavior;
  misbehavior.fault = DevSts::FaultAnswer{kTrust, "FailedAuthentication", "no", false, 200};
  Sts().SetMisbehavior(misbehavior);
  EXPECT_EQ(MessageOf<InvalidCredentialsException>([] { Acquire(); }), "Authentication failed: no");
}

struct StatusCase {
  int status;
  const char* reason;
};

class StatusTest : public RefusalTest, public testing::WithParamInterface<StatusCase> {};

TEST_P(StatusTest, IsNamedInTheMessageAndNoRedirectIsFollowed) {
  DevSts::Misbehavior misbehavior;
  misbehavior.httpAnswer = DevSts::HttpAnswer{GetParam().status,
                                              GetParam().reason,
                                              {{"Location", Sts().HttpsUrl("/elsewhere")}},
                                              "<html/>"};
  Sts().SetMisbehavior(misbehavior);
  EXPECT_EQ(CommunicationFailure(), "Server returned error: " + std::to_string(GetParam().status) +
                                        " " + GetParam().reason);
  EXPECT_EQ(Sts().Requests().size(), 1U);
}

INSTANTIATE_TEST_SUITE_P(
    Statuses, StatusTest,
    testing::Values(StatusCase{404, "Not Found"}, StatusCase{503, "Service Unavailable"},
                    StatusCase{301, "Moved Permanently"}, StatusCase{302, "Found"},
                    StatusCase{303, "See Other"}, StatusCase{307, "Temporary Redirect"},
                    StatusCase{308, "Permanent Redirect"}, StatusCase{300, "Multiple Choices"},
                    StatusCase{401, "Unauthorized"}, StatusCase{502, "Bad Gateway"}));

TEST_F(RefusalTest, GarbageInsteadOfXmlHasItsOwnMessage) {
  DevSts::Misbehavior misbehavior;
  misbehavior.httpAnswer = DevSts::HttpAnswer{200, "OK", {}, "this is no XML"};
  Sts().SetMisbehavior(misbehavior);
  EXPECT_THAT(MessageOf<SsoException>([] { Acquire(); }),
              StartsWith("Response is not well-formed XML: "));
}

TEST_F(RefusalTest, XmlThatIsNotAnAnswerIsRefused) {
  DevSts::Misbehavior misbehavior;
  misbehavior.httpAnswer = DevSts::HttpAnswer{200, "OK", {}, "<html><p/></html>"};
  Sts().SetMisbehavior(misbehavior);
  EXPECT_EQ(MessageOf<SsoException>([] { Acquire(); }),
            "Unexpected response format: missing SAOP Body.");
}

TEST_F(RefusalTest, GarbageInsteadOfHttpIsACommunicationFailure) {
  DevSts::Misbehavior misbehavior;
  misbehavior.rawAnswer = "220 mail.example ESMTP ready\r\n\r\n";
  misbehavior.closeUnannounced = true;
  Sts().SetMisbehavior(misbehavior);
  EXPECT_FALSE(CommunicationFailure().empty());
}

TEST_F(RefusalTest, PortThatNoProcessListensOnIsNamed) {
  // A socket that is bound to a free port and does not listen.
  const int probe = socket(AF_INET, SOCK_STREAM, 0);
  sockaddr_in address{};
  address.sin_family = AF_INET;
  address.sin_addr.s_addr = htonl(INADDR_LOOPBACK);
  socklen_t length = sizeof address;
  ASSERT_EQ(bind(probe, reinterpret_cast<sockaddr*>(&address), length), 0);
  ASSERT_EQ(getsockname(probe, reinterpret_cast<sockaddr*>(&address), &length), 0);
  const std::string endpoint = "127.0.0.1:" + std::to_string(ntohs(address.sin_port));
  const auto service = MakeService(Sts(), "https://" + endpoint + "/sts");
  const std::string message = MessageOf<CommunicationException>(
      [&] { service->AcquireToken(kUser, kPassword, TenMinutes()); });
  EXPECT_THAT(message, HasSubstr(endpoint));
  EXPECT_THAT(message, HasSubstr("refused"));
  close(probe);
}

TEST_F(RefusalTest, UnknownHostNameIsNamed) {
  const auto service = MakeService(Sts(), "https://sts.invalid/sts");
  EXPECT_THAT(MessageOf<CommunicationException>(
                  [&] { service->AcquireToken(kUser, kPassword, TenMinutes()); }),
              HasSubstr("sts.invalid"));
}

class ConfigurationTest : public StsTest {};

TEST_F(ConfigurationTest, HttpsWithoutAnSslContextIsRefused) {
  SecurityTokenServiceConfig config;
  config.url = "https://localhost/sts";
  config.tokenFactory = CreateSamlTokenFactory(nullptr);
  EXPECT_EQ(
      MessageOf<Tarnik::InvalidArgumentException>([&] { CreateSecurityTokenService(config); }),
      "HTTPS connection requested but no SSLContext provided.");
}

TEST_F(ConfigurationTest, MalformedUrlIsRefused) {
  SecurityTokenServiceConfig config;
  config.tokenFactory = CreateSamlTokenFactory(nullptr);
  for (const char* url :
       {"", "ftp://localhost/", "https://", "https://a b/", "http://h\r\nX: y/"}) {
    config.url = url;
    EXPECT_THROW(CreateSecurityTokenService(config), Tarnik::InvalidArgumentException) << url;
  }
}

TEST_F(ConfigurationTest, LifetimeMustBePositive) {
  for (const long lifetime : {0L, -1L}) {
    TokenSpec spec;
    spec.tokenLifetimeSec = lifetime;
    EXPECT_EQ(MessageOf<Tarnik::InvalidArgumentException>([&] { Acquire(spec); }),
              "Token lifetime must be positive");
  }
  EXPECT_TRUE(Sts().Requests().empty());
  TokenSpec spec;
  spec.tokenLifetimeSec = 1;
  EXPECT_NE(Acquire(spec), nullptr);
}

struct UnsendableCase {
  const char* name;
  std::string text;
};

class UnsendableTextTest : public StsTest, public testing::WithParamInterface<UnsendableCase> {};

TEST_P(UnsendableTextTest, IsRefusedBeforeAnythingIsSent) {
  const std::string& text = GetParam().text;
  TokenSpec audience = TenMinutes();
  audience.audienceRestriction = {text};
  TokenSpec delegate = TenMinutes();
  delegate.delegateTo = text;
  TokenSpec source = TenMinutes();
  source.advice = {{text, {}}};
  TokenSpec attribute = TenMinutes();
  attribute.advice = {{"s", {{text, {}}}}};
  TokenSpec value = TenMinutes();
  value.advice = {{"s", {{"a", {text}}}}};
  const auto service = Service();
  for (const auto& spec : {audience, delegate, source, attribute, value}) {
    EXPECT_THROW(service->AcquireToken(kUser, kPassword, spec), Tarnik::InvalidArgumentException);
  }
  EXPECT_THROW(service->AcquireToken(text, kPassword, TenMinutes()),
               Tarnik::InvalidArgumentException);
  const std::string message = MessageOf<Tarnik::InvalidArgumentException>(
      [&] { service->AcquireToken(kUser, text, TenMinutes()); });
  EXPECT_THAT(message, HasSubstr("wsse:Password"));
  EXPECT_THAT(message, testing::Not(HasSubstr("hush")));
  EXPECT_TRUE(Sts().Requests().empty());
}

INSTANTIATE_TEST_SUITE_P(Texts, UnsendableTextTest,
                         testing::Values(UnsendableCase{"Nul", std::string("hu\0sh", 5)},
                                         UnsendableCase{"Control", "hush\x01"},
                                         UnsendableCase{"BrokenUtf8", "hush\xC3"},
                                         UnsendableCase{"OverlongUtf8", "hush\xC0\x80"},
                                         UnsendableCase{"Surrogate", "hush\xED\xA0\x80"},
                                         UnsendableCase{"Fffe", "hush\xEF\xBF\xBE"}),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
