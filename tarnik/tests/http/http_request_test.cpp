#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/exception.h>
#include <tarnik/http/http_request.h>

#include "http/http_request_impl.h"
#include "support/sensitive_text.h"
#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

std::string Sent(const Ref<ClientRequest>& request, const RequestRoute& route) {
  SensitiveText wire;
  CheckedCast<ClientRequestImpl>(request.get())->MoveTo(route, wire);
  return wire.Text();
}

Ref<ClientRequest> Post(const std::string& target = "/sts/service?x=1") {
  Ref<ClientRequest> request;
  CreateHttpRequest(Method::POST, target, request);
  return request;
}

TEST(ClientRequestTest, WritesItsHeadersInOrderAndThenItsBody) {
  const auto request = Post();
  request->SetHeader("Content-Type", "text/xml");
  request->SetHeader("SOAPAction", "\"urn:issue\"");
  request->BodyWriter()->Write("<a/>");
  request->BodyWriter()->Write("\n");
  EXPECT_EQ(Sent(request, {"sts.example:7444", "", "id=1; x=2"}),
            "POST /sts/service?x=1 HTTP/1.1\r\n"
            "Host: sts.example:7444\r\n"
            "Content-Length: 5\r\n"
            "Cookie: id=1; x=2\r\n"
            "Content-Type: text/xml\r\n"
            "SOAPAction: \"urn:issue\"\r\n"
            "\r\n"
            "<a/>\n");
}

TEST(ClientRequestTest, SendsTheLengthOfAnEmptyPostAndNoEmptyCookieHeader) {
  EXPECT_EQ(Sent(Post("/"), {"h", "", ""}),
            "POST / HTTP/1.1\r\nHost: h\r\nContent-Length: 0\r\n\r\n");
}

TEST(ClientRequestTest, SendsNoLengthForAGetWithoutABody) {
  Ref<ClientRequest> request;
  CreateHttpRequest(Method::GET, "/", request);
  EXPECT_EQ(Sent(request, {"h", "", ""}), "GET / HTTP/1.1\r\nHost: h\r\n\r\n");
}

TEST(ClientRequestTest, PutsThePrefixBeforeAPathButNotBeforeAWholeUrl) {
  EXPECT_TRUE(Sent(Post("/a"), {"h", "http://h", ""}).starts_with("POST http://h/a HTTP/1.1\r\n"));
  EXPECT_TRUE(Sent(Post("https://x/a"), {"h", "http://h", ""})
                  .starts_with("POST https://x/a HTTP/1.1\r\n"));
}

TEST(ClientRequestTest, ReplacesAHeaderInPlaceIgnoringCase) {
  const auto request = Post("/");
  request->SetHeader("A", "1");
  request->SetHeader("B", "2");
  request->SetHeader("a", "3");
  EXPECT_TRUE(Sent(request, {"h", "", ""}).ends_with("\r\na: 3\r\nB: 2\r\n\r\n"));
}

TEST(ClientRequestTest, ForgetsItsBodyOnceMoved) {
  const auto request = Post("/");
  request->BodyWriter()->Write("secret");
  Sent(request, {"h", "", ""});
  EXPECT_TRUE(Sent(request, {"h", "", ""}).ends_with("Content-Length: 0\r\n\r\n"));
}

TEST(ClientRequestTest, PreservesEveryByteOfItsBody) {
  const auto request = Post("/");
  std::string body;
  for (int i = 0; i < 70000; ++i) {
    body.push_back(static_cast<char>(i * 31));
    request->BodyWriter()->Write({&body.back(), 1});
  }
  EXPECT_TRUE(Sent(request, {"h", "", ""}).ends_with("\r\n\r\n" + body));
}

TEST(ClientRequestTest, WriterOutlivesTheRequest) {
  auto writer = Post("/")->BodyWriter();
  writer->Write("late");
  EXPECT_EQ(writer->RefCount(), 1);
}

class BadTargetTest : public testing::TestWithParam<std::string> {};

TEST_P(BadTargetTest, IsRefused) {
  Ref<ClientRequest> request;
  EXPECT_THROW(CreateHttpRequest(Method::POST, GetParam(), request), InvalidArgumentException);
  EXPECT_EQ(request, nullptr);
}

INSTANTIATE_TEST_SUITE_P(Targets, BadTargetTest,
                         testing::Values("", " ", "/a b", "/a\r\nX: y", "/a\n", "/\t",
                                         std::string("/\0", 2), "/\x7F", "/\xC3\xA9",
                                         "/ HTTP/1.1\r\nHost: evil\r\n\r\n"));

struct BadHeader {
  std::string name;
  std::string value;
  const char* message;
};

class BadHeaderTest : public testing::TestWithParam<BadHeader> {};

TEST_P(BadHeaderTest, IsRefusedWithItsReason) {
  const auto request = Post("/");
  EXPECT_EQ(ThrownMessage<InvalidArgumentException>(
                [&request] { request->SetHeader(GetParam().name, GetParam().value); }),
            GetParam().message);
  EXPECT_EQ(Sent(request, {"h", "", ""}),
            "POST / HTTP/1.1\r\nHost: h\r\nContent-Length: 0\r\n\r\n");
}

constexpr const char* kNotToken = "The name of an HTTP header is not a token.";
constexpr const char* kBadValue = "The value of the HTTP header X holds a control character.";

INSTANTIATE_TEST_SUITE_P(
    Headers, BadHeaderTest,
    testing::Values(
        BadHeader{"", "1", kNotToken}, BadHeader{"X Y", "1", kNotToken},
        BadHeader{"X:", "1", kNotToken}, BadHeader{"X\r\n", "1", kNotToken},
        BadHeader{std::string("X\0", 2), "1", kNotToken}, BadHeader{"X\xC3\xA9", "1", kNotToken},
        BadHeader{"X", "a\r\nY: b", kBadValue}, BadHeader{"X", "a\nb", kBadValue},
        BadHeader{"X", "a\rb", kBadValue}, BadHeader{"X", std::string("a\0", 2), kBadValue},
        BadHeader{"X", "a\tb", kBadValue},
        BadHeader{"Host", "evil", "The HTTP header Host is set only by the user agent."},
        BadHeader{"content-length", "1",
                  "The HTTP header content-length is set only by the user agent."},
        BadHeader{"Transfer-Encoding", "chunked",
                  "The HTTP header Transfer-Encoding is set only by the user agent."},
        BadHeader{"CONNECTION", "close",
                  "The HTTP header CONNECTION is set only by the user agent."},
        BadHeader{"Cookie", "a=1", "The HTTP header Cookie is set only by the user agent."}));

}  // namespace
}  // namespace Tarnik::Testing
