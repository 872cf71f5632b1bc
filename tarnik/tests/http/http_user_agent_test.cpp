#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_response.h>
#include <tarnik/http/http_user_agent.h>
#include <tarnik/system/date_time.h>

#include "http/exchange_fixture.h"
#include "support/scripted_spec.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

class UserAgentTest : public ExchangeFixture {};

std::string HeadWith(const std::string& fields) {
  return "HTTP/1.1 200 OK\r\n" + fields + "Content-Length: 0\r\n\r\n";
}

TEST_F(UserAgentTest, SendsTheRequestUnchanged) {
  UseAnswer(kHello);
  ExchangeOnce();
  EXPECT_EQ(spec_->Streams().front()->Written(),
            "POST /sts HTTP/1.1\r\nHost: sts.example:443\r\nContent-Length: 4\r\n\r\n<a/>");
}

struct HostCase {
  const char* host;
  const char* endpointKey;
  bool isTls;
  const char* field;
};

class HostFieldTest : public ExchangeFixture, public testing::WithParamInterface<HostCase> {};

TEST_P(HostFieldTest, ContainsThePortUnlessItIsTheDefault) {
  ScriptedSpec::Script script;
  script.host = GetParam().host;
  script.endpointKey = GetParam().endpointKey;
  script.isTls = GetParam().isTls;
  script.stream.onWritten = AnswerWith(kHello);
  Use(script);
  EXPECT_EQ(ExchangeOnce(), "hello");
  EXPECT_NE(spec_->Streams().front()->Written().find("\r\nHost: " + std::string(GetParam().field) +
                                                     "\r\n"),
            std::string::npos)
      << spec_->Streams().front()->Written();
}

INSTANTIATE_TEST_SUITE_P(
    Hosts, HostFieldTest,
    testing::Values(HostCase{"sts.example", "sts.example:443", true, "sts.example"},
                    HostCase{"sts.example", "sts.example:80", false, "sts.example"},
                    HostCase{"sts.example", "sts.example:443", false, "sts.example:443"},
                    HostCase{"sts.example.", "sts.example.:8443", true, "sts.example.:8443"},
                    HostCase{"sts.example.", "sts.example.:443", true, "sts.example."},
                    HostCase{"sts.example", "sts.example:80", true, "sts.example:80"},
                    HostCase{"sts.example", "sts.example:7444", true, "sts.example:7444"},
                    HostCase{"sts.example", "sts.example", true, "sts.example"},
                    HostCase{"10.0.0.1", "10.0.0.1:7444", true, "10.0.0.1:7444"},
                    HostCase{"::1", "::1:7444", true, "[::1]:7444"},
                    HostCase{"::1", "::1:443", true, "[::1]"}));

class BadHostTest : public ExchangeFixture, public testing::WithParamInterface<std::string> {};

TEST_P(BadHostTest, IsRefusedBeforeAnythingIsSent) {
  ScriptedSpec::Script script;
  script.host = GetParam();
  Use(script);
  EXPECT_THROW(Send(), InvalidArgumentException);
  EXPECT_EQ(spec_->ConnectCount(), 0U);
}

INSTANTIATE_TEST_SUITE_P(Hosts, BadHostTest,
                         testing::Values("", " ", "sts example", "sts.example\r\nX: y",
                                         "sts\nexample", std::string("sts\0example", 11),
                                         "sts.example/", "a@b"));

TEST_F(UserAgentTest, SendsTheWholeUrlToAProxy) {
  ScriptedSpec::Script script;
  script.isProxy = true;
  script.endpointKey = "sts.example:8080";
  script.stream.onWritten = AnswerWith(kHello);
  Use(script);
  ExchangeOnce();
  EXPECT_TRUE(spec_->Streams().front()->Written().starts_with(
      "POST http://sts.example:8080/sts HTTP/1.1\r\nHost: sts.example:8080\r\n"));
}

TEST_F(UserAgentTest, RefusesToSendARequestTwice) {
  UseAnswer(kHello);
  const auto request = PostRequest();
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = agent_->SendAsync(request.get(), RecordIn(record), 0);
  EXPECT_THROW(agent_->SendAsync(request.get(), RecordIn(record), 0), InvalidStateException);
  agent_->Wait(item.get(), kPlentyOfTime);
  EXPECT_EQ(record->count, 1);
}

TEST_F(UserAgentTest, RefusesNullAndForeignArguments) {
  UseAnswer(kHello);
  EXPECT_THROW(agent_->SendAsync(nullptr, RecordIn(std::make_shared<CompletionRecord>()), 0),
               InvalidArgumentException);
  EXPECT_THROW(agent_->SendAsync(PostRequest().get(), nullptr, 0), InvalidArgumentException);
  EXPECT_THROW(agent_->Wait(nullptr, 0), TypeMismatchException);
  EXPECT_THROW(CreateHttpUserAgent(nullptr, nullptr, nullptr), TypeMismatchException);
}

TEST_F(UserAgentTest, SendsTheCookiesThatItReceived) {
  const auto cookies = CreateCookieStore("");
  ScriptedSpec::Script script;
  script.stream.onWritten =
      AnswerWith(HeadWith("Set-Cookie: leg=1; HttpOnly\r\nX: y\r\nset-cookie: node=7\r\n"));
  Use(script, cookies.get());
  ExchangeOnce();
  EXPECT_EQ(spec_->Streams().front()->Written().find("Cookie:"), std::string::npos);
  ExchangeOnce();
  EXPECT_NE(spec_->Streams().front()->Written().find("\r\nCookie: leg=1; node=7\r\n"),
            std::string::npos);
}

TEST_F(UserAgentTest, StoresCookiesBeforeTheCompletionRuns) {
  const auto cookies = CreateCookieStore("");
  ScriptedSpec::Script script;
  script.stream.onWritten = AnswerWith(HeadWith("Set-Cookie: leg=1\r\n"));
  Use(script, cookies.get());
  std::string seen;
  const auto item = agent_->SendAsync(
      PostRequest().get(),
      [&](Exception*, ClientResponse*, PendingRequestItem*) {
        seen = cookies->HeaderFor("sts.example", "/", false, System::GetUtcDateTime());
      },
      0);
  agent_->Wait(item.get(), kPlentyOfTime);
  EXPECT_EQ(seen, "leg=1");
}

TEST_F(UserAgentTest, IgnoresCookiesForAnotherHost) {
  const auto cookies = CreateCookieStore("");
  const System::DateTime now = System::GetUtcDateTime();
  cookies->Store("other.example", "/", true, "other=1; Path=/", now);
  ScriptedSpec::Script script;
  script.stream.onWritten = AnswerWith(HeadWith("Set-Cookie: evil=1; Domain=other.example\r\n"));
  Use(script, cookies.get());
  ExchangeOnce();
  ExchangeOnce();
  EXPECT_EQ(spec_->Streams().front()->Written().find("Cookie:"), std::string::npos);
  EXPECT_EQ(cookies->HeaderFor("other.example", "/", true, now), "other=1");
}

TEST_F(UserAgentTest, SendsSecureCookiesOnlyOverTls) {
  const auto cookies = CreateCookieStore("");
  cookies->Store("sts.example", "/", true, "s=1; Secure; Path=/", System::GetUtcDateTime());
  for (const bool isTls : {true, false}) {
    ScriptedSpec::Script script;
    script.isTls = isTls;
    script.stream.onWritten = AnswerWith(kHello);
    Use(script, cookies.get());
    ExchangeOnce();
    EXPECT_EQ(spec_->Streams().front()->Written().find("\r\nCookie: s=1\r\n") != std::string::npos,
              isTls);
  }
}

TEST_F(UserAgentTest, MatchesCookiePathsAgainstAWholeUrl) {
  const auto cookies = CreateCookieStore("");
  cookies->Store("sts.example", "/", true, "s=1; Path=/deep", System::GetUtcDateTime());
  ScriptedSpec::Script script;
  script.stream.onWritten = AnswerWith(kHello);
  Use(script, cookies.get());
  const auto record = std::make_shared<CompletionRecord>();
  const auto item =
      agent_->SendAsync(PostRequest("", "https://sts.example/deep/x").get(), RecordIn(record), 0);
  agent_->Wait(item.get(), kPlentyOfTime);
  EXPECT_NE(spec_->Streams().front()->Written().find("\r\nCookie: s=1\r\n"), std::string::npos);
}

}  // namespace
}  // namespace Tarnik::Testing
