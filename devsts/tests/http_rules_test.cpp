#include <cstddef>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "devsts/server.h"
#include "raw_client.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using testing::StartsWith;

std::string AnswerTo(const Server& server, const std::string& request) {
  RawClient client(server.HttpPort());
  client.Send(request);
  return client.ReadAnswer();
}

struct HeadCase {
  const char* name;
  const char* from;
  const char* to;
  const char* reason;
};

class RefusedHttpHeadTest : public testing::TestWithParam<HeadCase> {};

TEST_P(RefusedHttpHeadTest, SaysExactlyWhatIsWrong) {
  const Server server;
  const HeadCase& test = GetParam();
  const std::string answer =
      AnswerTo(server, Replaced(PostOf(AliceEnvelope(), kIssueAction), test.from, test.to));
  EXPECT_EQ(ElementText(answer, "faultcode"), "wst:InvalidRequest");
  EXPECT_EQ(ElementText(answer, "faultstring"), test.reason);
}

INSTANTIATE_TEST_SUITE_P(
    EveryField, RefusedHttpHeadTest,
    testing::Values(
        HeadCase{"Method", "POST", "PUT", "The method is not POST but PUT"},
        HeadCase{"ContentType", "text/xml", "application/soap+xml",
                 "Content-Type is not text/xml but application/soap+xml"},
        HeadCase{"OtherEncoding", "text/xml", "text/xml; charset=utf-16",
                 "Content-Type is not text/xml but text/xml; charset=utf-16"},
        HeadCase{"Compressed", "SOAPAction:", "Content-Encoding: gzip\r\nSOAPAction:",
                 "Content-Encoding is not expected"},
        HeadCase{"NoHost", "Host:", "X-Host:", "Host is not given exactly once"},
        HeadCase{"TwoHosts", "Host:", "Host: one\r\nHost:", "Host is not given exactly once"},
        HeadCase{"NoContentType", "Content-Type: text/xml\r\n", "",
                 "Content-Type is not given exactly once"},
        HeadCase{"NoAction", "SOAPAction:", "X-Action:", "SOAPAction is not given exactly once"},
        HeadCase{"OtherAction", "RST/Issue\"", "RST/Cancel\"",
                 "Unsupported SOAPAction: "
                 "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Cancel"}),
    [](const auto& test) { return test.param.name; });

TEST(HttpRulesTest, TakesTheEncodingInTheContentType) {
  const Server server;
  const std::string request = PostOf(AliceEnvelope(), kIssueAction);
  for (const char* type : {"text/xml; charset=utf-8", "text/xml;charset=\"UTF-8\""}) {
    EXPECT_THAT(AnswerTo(server, Replaced(request, "text/xml", type)), StartsWith("HTTP/1.1 200 "));
  }
}

TEST(HttpRulesTest, EndsAConnectionWhoseChunkHeadHasNoEnd) {
  constexpr std::size_t kMost = std::size_t{1} << 20U;
  const Server server;
  RawClient client(server.HttpPort());
  client.Send("POST /sts HTTP/1.1\r\nHost: localhost\r\nTransfer-Encoding: chunked\r\n\r\n1;");
  client.Send(std::string(kMost - 2, 'a'));
  client.Send("aaaa");
  EXPECT_TRUE(server.WaitUntil([](const Counters& counters) {
    return counters.malformedRequests == 1 && counters.connectionsOpen == 0;
  }));
}

TEST(HttpRulesTest, CountsInputThatIsNotHttp) {
  const Server server;
  RawClient client(server.HttpPort());
  client.Send("hello\r\n\r\n");
  EXPECT_EQ(client.ReadToEnd(), "");
  EXPECT_TRUE(server.WaitUntil([](const Counters& counters) {
    return counters.malformedRequests == 1 && counters.connectionsOpen == 0;
  }));
}

}  // namespace
}  // namespace DevSts::Testing
