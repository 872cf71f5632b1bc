#include "http/response_parser.h"

#include <algorithm>
#include <cstddef>
#include <optional>
#include <string>
#include <string_view>
#include <tuple>
#include <utility>

#include <gtest/gtest.h>

#include <tarnik/http/http_exception.h>
#include <tarnik/http/http_user_agent.h>

#include "http/response_body.h"
#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

constexpr const char* kPeer = "sts.example:443";

void FeedInPieces(ResponseParser& parser, std::string_view bytes, std::size_t pieceSize) {
  for (; !bytes.empty(); bytes.remove_prefix(std::min(pieceSize, bytes.size()))) {
    parser.Feed(bytes.substr(0, pieceSize));
  }
}

/// The message with which `bytes`, followed by the end of the connection, are rejected; empty if
/// they are accepted.
std::string RefusalOf(const std::string& bytes, std::size_t pieceSize) {
  ResponseParser parser(kPeer);
  try {
    FeedInPieces(parser, bytes, pieceSize);
    parser.FeedEnd();
  } catch (const HttpException& failure) {
    const bool isCutOff = dynamic_cast<const CutOffException*>(&failure) != nullptr;
    const std::string& message = failure.Message();
    EXPECT_EQ(isCutOff, message.find(" was cut off in its ") != std::string::npos ||
                            message == "sts.example:443 closed the connection without an answer.")
        << message;
    return message;
  }
  return {};
}

struct GoodAnswer {
  std::string bytes;
  int code;
  std::string reason;
  std::string body;
  bool mayReuse;
};

class GoodAnswerTest : public testing::TestWithParam<std::tuple<GoodAnswer, std::size_t>> {};

TEST_P(GoodAnswerTest, IsReadInPiecesOfAnySize) {
  const auto& [answer, pieceSize] = GetParam();
  ResponseParser parser(kPeer);
  FeedInPieces(parser, answer.bytes, pieceSize);
  ASSERT_TRUE(parser.IsDone()) << answer.bytes;
  EXPECT_EQ(parser.MayReuseConnection(), answer.mayReuse);
  const auto response = parser.TakeResponse();
  EXPECT_EQ(response->Status().code, answer.code);
  EXPECT_EQ(response->Status().reason, answer.reason);
  EXPECT_EQ(BodyOf(*response), answer.body);
}

const GoodAnswer kGoodAnswers[] = {
    {"HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhello", 200, "OK", "hello", true},
    {"HTTP/1.1 200 OK\r\nContent-Length: 0\r\n\r\n", 200, "OK", "", true},
    {"HTTP/1.1 200 OK\r\ncontent-LENGTH:\t 005 \t\r\n\r\nhello", 200, "OK", "hello", true},
    {"HTTP/1.1 200 \r\nContent-Length: 5\r\n\r\nhello", 200, "", "hello", true},
    {"HTTP/1.1 500 Internal Server Error\r\nContent-Length: 5\r\n\r\nfault", 500,
     "Internal Server Error", "fault", true},
    {"HTTP/1.1 302 Found\r\nLocation: https://evil.example/\r\nContent-Length: 0\r\n\r\n", 302,
     "Found", "", true},
    {"HTTP/1.1 999 \r\nContent-Length: 0\r\n\r\n", 999, "", "", true},
    {"HTTP/1.1 204 No Content\r\n\r\n", 204, "No Content", "", true},
    {"HTTP/1.1 304 Not Modified\r\nContent-Length: 5\r\n\r\n", 304, "Not Modified", "", true},
    {"HTTP/1.1 200 OK\r\nConnection: close\r\nContent-Length: 5\r\n\r\nhello", 200, "OK", "hello",
     false},
    {"HTTP/1.1 200 OK\r\nConnection: x, CLOSE\r\nContent-Length: 5\r\n\r\nhello", 200, "OK",
     "hello", false},
    {"HTTP/1.0 200 OK\r\nContent-Length: 5\r\n\r\nhello", 200, "OK", "hello", false},
    {"HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n5\r\nhello\r\n0\r\n\r\n", 200, "OK",
     "hello", true},
    {"HTTP/1.1 200 OK\r\nTransfer-Encoding: Chunked\r\n\r\n1\r\nh\r\n00a\r\n0123456789\r\n"
     "0\r\n\r\n",
     200, "OK", "h0123456789", true},
    {"HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n5;a;b=c;d=\"e;f\"\r\nhello\r\n0;x\r\n"
     "Trailer: value\r\n\r\n",
     200, "OK", "hello", true},
    {"HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n0\r\n\r\n", 200, "OK", "", true},
    {"HTTP/1.1 100 Continue\r\n\r\nHTTP/1.1 103 Early Hints\r\nLink: </a>\r\n\r\n"
     "HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhello",
     200, "OK", "hello", true},
    {"HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhello, and more", 200, "OK", "hello", false},
    {"HTTP/1.1 204 No Content\r\n\r\nsurplus", 204, "No Content", "", false},
};

INSTANTIATE_TEST_SUITE_P(Answers, GoodAnswerTest,
                         testing::Combine(testing::ValuesIn(kGoodAnswers),
                                          testing::Values<std::size_t>(1, 2, 3, 7, 100000)));

TEST(ResponseParserTest, FindsTheFirstHeaderIgnoringCase) {
  ResponseParser parser(kPeer);
  parser.Feed("HTTP/1.1 200 OK\r\nX-Id:  one two \r\nx-id: three\r\nContent-Length: 0\r\n\r\n");
  const auto response = parser.TakeResponse();
  EXPECT_EQ(response->Header("X-ID"), "one two");
  EXPECT_EQ(response->Header("absent"), std::nullopt);
}

TEST(ResponseParserTest, KeepsTrailersOutOfTheHeaders) {
  ResponseParser parser(kPeer);
  parser.Feed(
      "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n0\r\nSet-Cookie: evil=1\r\n\r\n");
  ASSERT_TRUE(parser.IsDone());
  EXPECT_EQ(parser.TakeResponse()->Header("Set-Cookie"), std::nullopt);
}

TEST(ResponseParserTest, KeepsHeadersOfInterimAnswersOutOfTheFinalOne) {
  ResponseParser parser(kPeer);
  parser.Feed("HTTP/1.1 103 Early\r\nX: 1\r\n\r\nHTTP/1.1 200 OK\r\nContent-Length: 0\r\n\r\n");
  EXPECT_EQ(parser.TakeResponse()->Header("X"), std::nullopt);
}

TEST(ResponseParserTest, ReadsABodyWithoutLengthUntilTheConnectionEnds) {
  ResponseParser parser(kPeer);
  FeedInPieces(parser, "HTTP/1.1 200 OK\r\n\r\nhello", 1);
  EXPECT_FALSE(parser.IsDone());
  parser.FeedEnd();
  EXPECT_TRUE(parser.IsDone());
  EXPECT_FALSE(parser.MayReuseConnection());
  EXPECT_EQ(BodyOf(*parser.TakeResponse()), "hello");
}

TEST(ResponseParserTest, RefusesAnEndBeforeTheFirstByte) {
  EXPECT_EQ(RefusalOf("", 1), "sts.example:443 closed the connection without an answer.");
}

class TruncatedAnswerTest : public testing::TestWithParam<std::string> {};

TEST_P(TruncatedAnswerTest, IsRefusedWhereverItIsCut) {
  const std::string& answer = GetParam();
  const std::size_t headSize = answer.rfind("\r\n\r\n", answer.find("hello")) + 4;
  for (std::size_t size = 1; size < answer.size(); ++size) {
    EXPECT_EQ(RefusalOf(answer.substr(0, size), 5),
              size < headSize ? "The answer from sts.example:443 was cut off in its header."
                              : "The answer from sts.example:443 was cut off in its body.")
        << size;
  }
  EXPECT_EQ(RefusalOf(answer, 5), "");
}

INSTANTIATE_TEST_SUITE_P(
    Answers, TruncatedAnswerTest,
    testing::Values(
        "HTTP/1.1 200 OK\r\nContent-Type: text/xml\r\nContent-Length: 5\r\n\r\nhello",
        "HTTP/1.0 200 OK\r\nContent-Length: 5\r\n\r\nhello",
        "HTTP/1.1 100 Continue\r\n\r\nHTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhello",
        "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n5\r\nhello\r\n"
        "1;ext=\"x\"\r\n!\r\n0\r\nTrailer: x\r\n\r\n"));

struct BadAnswer {
  std::string bytes;
  std::string fault;
};

class BadAnswerTest : public testing::TestWithParam<std::tuple<BadAnswer, std::size_t>> {};

TEST_P(BadAnswerTest, IsRefusedWithItsFault) {
  const auto& [answer, pieceSize] = GetParam();
  EXPECT_EQ(RefusalOf(answer.bytes, pieceSize),
            "The answer from sts.example:443 " + answer.fault + ".");
}

std::string Head(const std::string& fields) {
  return "HTTP/1.1 200 OK\r\n" + fields + "\r\n\r\nhello";
}

std::string Chunks(const std::string& chunks) {
  return "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n" + chunks;
}

const std::string kNotHttp = "does not begin as an answer in HTTP/1.1";
const std::string kStatusLine = "has a malformed status line";
const std::string kStatusCode = "has a status code outside 100 to 999";
const std::string kLength = "has a malformed Content-Length";
const std::string kCoding = "uses a transfer coding other than chunked, once";
const std::string kBothFramings = "gives both Content-Length and Transfer-Encoding";
const std::string kBareLineEnd = "has a bare carriage return or line feed in its header";
const std::string kControl = "has a control character in its header";
const std::string kName = "has a malformed header name";
const std::string kFolded = "has a folded header line";
const std::string kBlankBeforeColon = "has a blank before the colon of a header line";
const std::string kBadChunk = "has a malformed body: bad chunk";
const std::string kBadExtension = "has a malformed body: bad chunk extension";
const std::string kBodyLimit = "has a body of more than 16777216 bytes";

const BadAnswer kBadAnswers[] = {
    {"\x15\x03\x03", kNotHttp},
    {"SSH-2.0-x\r\n", kNotHttp},
    {"\r\nHTTP/1.1 200 OK\r\n\r\n", kNotHttp},
    {"http/1.1 200 OK\r\n\r\n", kNotHttp},
    {"HTTP/2.0 200 OK\r\n\r\n", kNotHttp},
    {"HTTP/1.2 200 OK\r\n\r\n", "is of a version of HTTP other than 1.0 and 1.1"},
    {"HTTP/1.10 200 OK\r\n\r\n", kStatusLine},
    {"HTTP/1.1  200 OK\r\n\r\n", kStatusLine},
    {"HTTP/1.1 2000 OK\r\n\r\n", kStatusLine},
    {"HTTP/1.1 200\r\n\r\n", kStatusLine},
    {"HTTP/1.1\r\n\r\n", kStatusLine},
    {"HTTP/1.1 2x0 OK\r\n\r\n", kStatusCode},
    {"HTTP/1.1 099 OK\r\n\r\n", kStatusCode},
    {"HTTP/1.1 -20 OK\r\n\r\n", kStatusCode},
    {Head("Content-Length: +5"), kLength},
    {Head("Content-Length: -5"), kLength},
    {Head("Content-Length: 0x10"), kLength},
    {Head("Content-Length: 5 5"), kLength},
    {Head("Content-Length: 5,5"), kLength},
    {Head("Content-Length: 5;"), kLength},
    {Head("Content-Length: "), kLength},
    {Head("Content-Length: 5e0"), kLength},
    {Head("Content-Length: 18446744073709551616"), kLength},
    {Head("Content-Length: 18446744073709551621"), kLength},
    {Head("Content-Length: 99999999999999999999999999"), kLength},
    {Head("Content-Length: 9999999999999999999"), kBodyLimit},
    {Head("Content-Length: 16777217"), kBodyLimit},
    {Head("Content-Length: 5\r\nContent-Length: 5"), "gives its Content-Length more than once"},
    {Head("Content-Length: 5\r\ncontent-length: 4"), "gives its Content-Length more than once"},
    {Head("Content-Length: 5\r\nTransfer-Encoding: chunked"), kBothFramings},
    {Head("Transfer-Encoding: chunked\r\nContent-Length: 5"), kBothFramings},
    {Head("Transfer-Encoding: gzip, chunked"), kCoding},
    {Head("Transfer-Encoding: chunked, chunked"), kCoding},
    {Head("Transfer-Encoding: identity"), kCoding},
    {Head("Transfer-Encoding: xchunked"), kCoding},
    {Head("Transfer-Encoding: \"chunked\""), kCoding},
    {Head("Transfer-Encoding: "), kCoding},
    {Head("Transfer-Encoding: chunked\r\nTransfer-Encoding: chunked"), kCoding},
    {"HTTP/1.0 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n0\r\n\r\n",
     "uses a transfer coding in HTTP/1.0"},
    {Head("Content-Length : 5"), kBlankBeforeColon},
    {Head("Content-Length\t: 5"), kBlankBeforeColon},
    {Head("X: a\r\n b"), kFolded},
    {Head("X: a\r\n\tb"), kFolded},
    {Head(" X: a"), kFolded},
    {Head("X: a\rY: b"), kBareLineEnd},
    {Head("X: a\nY: b"), kBareLineEnd},
    {"HTTP/1.1 200 OK\nContent-Length: 0\n\n", kBareLineEnd},
    {"HTTP/1.1 200 OK\r\rContent-Length: 0\r\n\r\n", kBareLineEnd},
    {Head(std::string("X: a\0b", 6)), kControl},
    {Head(std::string("X\0Y: b", 6)), kControl},
    {Head("X: \x1B[31m"), kControl},
    {Head("X: \x7F"), kControl},
    {"HTTP/1.1 200 O\x01K\r\n\r\n", kControl},
    {Head("no colon"), "has a header line without a colon"},
    {Head(": value"), kName},
    {Head("X Y: value"), kName},
    {Head("X(: value"), kName},
    {Head("X\xC3\xA9: value"), kName},
    {"HTTP/1.1 101 Switching Protocols\r\nUpgrade: x\r\n\r\n",
     "switches to another protocol without being asked"},
    {Chunks("-1\r\nh\r\n0\r\n\r\n"), kBadChunk},
    {Chunks("+1\r\nh\r\n0\r\n\r\n"), kBadChunk},
    {Chunks("g\r\nh\r\n0\r\n\r\n"), kBadChunk},
    {Chunks("\r\nh\r\n0\r\n\r\n"), kBadChunk},
    {Chunks(" 1\r\nh\r\n0\r\n\r\n"), kBadChunk},
    {Chunks("10000000000000000\r\nh\r\n0\r\n\r\n"), kBadChunk},
    {Chunks("0x1\r\nh\r\n0\r\n\r\n"), kBadExtension},
    {Chunks("1 \r\nh\r\n0\r\n\r\n"), kBadExtension},
    {Chunks("1;\r\nh\r\n0\r\n\r\n"), kBadExtension},
    {Chunks("1;a=\"b\r\nh\r\n0\r\n\r\n"), "was cut off in its body"},
    {Chunks("1;a=\"b\r\nh\r\n0\"\r\n\r\n"), kBadExtension},
    {Chunks("1\r\nhX\r\n0\r\n\r\n"), kBadChunk},
    {Chunks("5\r\nhell\r\n0\r\n\r\n"), kBadChunk},
    {Chunks("ffffffffffffffff\r\nh"), kBodyLimit},
    {Chunks("1000001\r\nh"), kBodyLimit},
    {Chunks("1000000\r\n"), "was cut off in its body"},
};

INSTANTIATE_TEST_SUITE_P(Answers, BadAnswerTest,
                         testing::Combine(testing::ValuesIn(kBadAnswers),
                                          testing::Values<std::size_t>(1, 4, 100000)));

class BadChunkLineEndTest : public testing::TestWithParam<const char*> {};

TEST_P(BadChunkLineEndTest, IsRefused) {
  EXPECT_EQ(RefusalOf(Chunks(GetParam()), 1), RefusalOf(Chunks(GetParam()), 100000));
  EXPECT_NE(RefusalOf(Chunks(GetParam()), 1), "");
}

INSTANTIATE_TEST_SUITE_P(Bodies, BadChunkLineEndTest,
                         testing::Values("1\nh\n0\n\n", "1\rh\r\n0\r\n\r\n", "1\r\nh\n0\r\n\r\n",
                                         "0\r\nX\r\n\r\n", "0\r\nContent-Length: 5\r\n\r\n",
                                         "0\r\nTransfer-Encoding: chunked\r\n\r\n",
                                         "0\r\nX : y\r\n\r\n", "0\r\n\n", "0\r\n\r\r\n"));

std::string HeadOfSize(std::size_t size) {
  const std::string start = "HTTP/1.1 200 OK\r\nContent-Length: 0\r\nX: ";
  const std::string end = "\r\n\r\n";
  return start + std::string(size - start.size() - end.size(), 'x') + end;
}

const std::string kHeaderLimit =
    "The answer from sts.example:443 has a header of more than 65536 bytes.";

TEST(ResponseParserLimitsTest, AcceptsTheLargestHeaderAndRefusesALargerOne) {
  for (const std::size_t pieceSize : {std::size_t{1}, std::size_t{16384}, std::size_t{1000000}}) {
    EXPECT_EQ(RefusalOf(HeadOfSize(kMaxHeaderBytes), pieceSize), "");
    EXPECT_EQ(RefusalOf(HeadOfSize(kMaxHeaderBytes + 1), pieceSize), kHeaderLimit);
  }
}

TEST(ResponseParserLimitsTest, RefusesAnEndlessHeaderAsSoonAsItIsTooLong) {
  ResponseParser parser(kPeer);
  std::size_t fed = 0;
  const auto feedForEver = [&] {
    parser.Feed("HTTP/1.1 200 OK\r\n");
    for (fed = 17; fed < 10 * kMaxHeaderBytes; fed += 4) {
      parser.Feed("a:\r\n");
    }
  };
  EXPECT_THROW(feedForEver(), HttpException);
  EXPECT_LE(fed, kMaxHeaderBytes);
}

TEST(ResponseParserLimitsTest, CountsInterimHeadersTowardsTheHeaderLimit) {
  const std::string interim = "HTTP/1.1 100 Continue\r\n\r\n";
  EXPECT_EQ(RefusalOf(interim + HeadOfSize(kMaxHeaderBytes - interim.size()), 1000), "");
  EXPECT_EQ(RefusalOf(interim + HeadOfSize(kMaxHeaderBytes - interim.size() + 1), 1000),
            kHeaderLimit);
}

TEST(ResponseParserLimitsTest, SkipsAtMostSixteenInterimAnswers) {
  std::string answers;
  for (int i = 0; i < 16; ++i) {
    answers += "HTTP/1.1 102 Processing\r\n\r\n";
  }
  const std::string last = "HTTP/1.1 200 OK\r\nContent-Length: 0\r\n\r\n";
  EXPECT_EQ(RefusalOf(answers + last, 7), "");
  EXPECT_EQ(RefusalOf(answers + "HTTP/1.1 102 Processing\r\n\r\n" + last, 7),
            "The answer from sts.example:443 is preceded by more than 16 interim answers.");
}

TEST(ResponseParserLimitsTest, AcceptsTheLargestBodyByLength) {
  ResponseParser parser(kPeer);
  parser.Feed("HTTP/1.1 200 OK\r\nContent-Length: 16777216\r\n\r\n");
  FeedInPieces(parser, std::string(kMaxBodyBytes, 'x'), 16384);
  ASSERT_TRUE(parser.IsDone());
  EXPECT_EQ(BodyOf(*parser.TakeResponse()).size(), kMaxBodyBytes);
}

TEST(ResponseParserLimitsTest, StopsAtTheLimitOfAChunkedBody) {
  ResponseParser parser(kPeer);
  parser.Feed("HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\nffffff\r\n");
  FeedInPieces(parser, std::string(kMaxBodyBytes - 1, 'x'), 16384);
  parser.Feed("\r\n1\r\nx\r\n");
  EXPECT_THROW(parser.Feed("1\r\n"), HttpException);
}

TEST(ResponseParserLimitsTest, StopsAtTheLimitOfABodyWithoutLength) {
  ResponseParser parser(kPeer);
  parser.Feed("HTTP/1.1 200 OK\r\n\r\n");
  FeedInPieces(parser, std::string(kMaxBodyBytes, 'x'), 16384);
  EXPECT_THROW(parser.Feed("x"), HttpException);
}

class EndlessFramingTest : public testing::TestWithParam<std::pair<const char*, const char*>> {};

TEST_P(EndlessFramingTest, IsRefusedSoon) {
  const auto& [start, repeated] = GetParam();
  const std::string piece = repeated;
  ResponseParser parser(kPeer);
  parser.Feed(Chunks(start));
  std::size_t fed = 0;
  std::string message;
  try {
    for (; fed < 100 * kMaxHeaderBytes; fed += piece.size()) {
      parser.Feed(piece);
    }
  } catch (const HttpException& exception) {
    message = exception.Message();
  }
  EXPECT_EQ(message,
            "The answer from sts.example:443 spends more bytes on chunk headers and trailers than "
            "any honest one.");
  EXPECT_LE(fed, 3 * kMaxHeaderBytes);
}

INSTANTIATE_TEST_SUITE_P(Repetitions, EndlessFramingTest,
                         testing::Values(std::pair{"1", ";extension"},
                                         std::pair{"1;a=\"", "aaaaaaaaaaaaaaaa"},
                                         std::pair{"0", "0000000000000000"},
                                         std::pair{"0\r\n", "Trailer: x\r\n"},
                                         std::pair{"", "1;extension=that-is-long\r\nx\r\n"}));

TEST(ResponseParserLimitsTest, AcceptsABodyInChunksOfOneByte) {
  ResponseParser parser(kPeer);
  parser.Feed("HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n");
  for (int i = 0; i < 100000; ++i) {
    parser.Feed("1\r\nx\r\n");
  }
  parser.Feed("0\r\n\r\n");
  ASSERT_TRUE(parser.IsDone());
  EXPECT_EQ(BodyOf(*parser.TakeResponse()).size(), 100000U);
}

}  // namespace
}  // namespace Tarnik::Testing
