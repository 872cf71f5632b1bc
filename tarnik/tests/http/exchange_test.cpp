#include "http/exchange.h"

#include <atomic>
#include <chrono>
#include <cstddef>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/http/http_exception.h>
#include <tarnik/http/http_response.h>
#include <tarnik/http/http_user_agent.h>

#include "http/exchange_fixture.h"
#include "http/response_body.h"
#include "support/scripted_spec.h"
#include "support/scripted_stream.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

class ExchangeTest : public ExchangeFixture {};

constexpr const char* kChunkedHello =
    "HTTP/1.1 200 OK\r\nTransfer-Encoding: chunked\r\n\r\n5\r\nhello\r\n0\r\n\r\n";

TEST_F(ExchangeTest, ReturnsTheAnswerToCompletionAndWaiter) {
  UseAnswer("HTTP/1.1 500 Internal Server Error\r\nX: y\r\nContent-Length: 5\r\n\r\nfault");
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record);
  const auto response = agent_->Wait(item.get(), kPlentyOfTime);
  EXPECT_EQ(response->Status().code, 500);
  EXPECT_EQ(response->Status().reason, "Internal Server Error");
  EXPECT_EQ(response->Header("x"), "y");
  EXPECT_EQ(record->body, "fault");
  EXPECT_EQ(record->count, 1);
  EXPECT_EQ(agent_->Wait(item.get(), 0), response);
}

TEST_F(ExchangeTest, ReadsAnAnswerInPiecesOfAnySize) {
  for (const std::size_t pieceSize : {1, 2, 5, 1000}) {
    for (const char* answer : {kHello, kChunkedHello}) {
      ScriptedSpec::Script script;
      script.stream.pieceSize = pieceSize;
      script.stream.onWritten = AnswerWith(answer);
      Use(script);
      EXPECT_EQ(ExchangeOnce(), "hello");
    }
  }
}

TEST_F(ExchangeTest, DoesNotFollowRedirects) {
  for (int code = 300; code < 400; ++code) {
    UseAnswer("HTTP/1.1 " + std::to_string(code) +
              " Moved\r\nLocation: http://evil.example/\r\nConnection: close\r\nContent-Length: "
              "0\r\n\r\n");
    const auto item = Send();
    EXPECT_EQ(agent_->Wait(item.get(), kPlentyOfTime)->Status().code, code);
    EXPECT_EQ(spec_->ConnectCount(), 1U);
  }
}

TEST_F(ExchangeTest, ReportsAFailedConnectAndDropsItsStream) {
  ScriptedSpec::Script script;
  script.connectError = "Cannot connect to sts.example:443: Connection refused";
  Use(script);
  EXPECT_EQ(ExchangeOnce(), "Cannot connect to sts.example:443: Connection refused");
}

TEST_F(ExchangeTest, ReportsAConnectWithoutAStream) {
  ScriptedSpec::Script script;
  script.omitsStream = true;
  Use(script);
  EXPECT_EQ(ExchangeOnce(), "The connection to sts.example:443 was opened without a stream.");
}

TEST_F(ExchangeTest, ThrowsWhatTheSpecThrowsAndNeverCompletes) {
  ScriptedSpec::Script script;
  script.startError = "bad host";
  Use(script);
  const auto record = std::make_shared<CompletionRecord>();
  EXPECT_THROW(Send(record, kSecond / 10), InvalidArgumentException);
  EXPECT_TRUE(Eventually([&] { return record.use_count() == 1; }));
  EXPECT_EQ(record->count, 0);
}

TEST_F(ExchangeTest, ReportsAWriteThatFailsAtAnyByte) {
  UseAnswer(kHello);
  ExchangeOnce();
  const std::size_t size = spec_->Streams().front()->Written().size();
  for (std::size_t at = 0; at < size; ++at) {
    ScriptedSpec::Script script;
    script.stream.failWriteAt = at;
    script.stream.onWritten = AnswerWith(kHello);
    Use(script);
    EXPECT_EQ(ExchangeOnce(), "The write failed.") << at;
    EXPECT_TRUE(spec_->Streams().front()->IsClosed());
  }
}

TEST_F(ExchangeTest, RefusesAnAnswerThatEndsAtAnyByte) {
  for (const std::string answer : {kHello, kChunkedHello}) {
    for (std::size_t size = 0; size < answer.size(); ++size) {
      ScriptedSpec::Script script;
      script.stream.onWritten = [&](ScriptedStream& stream) {
        stream.Push(answer.substr(0, size));
        stream.PushEnd();
      };
      Use(script);
      const std::string result = ExchangeOnce();
      const std::size_t headSize = answer.find("\r\n\r\n") + 4;
      const std::string expected =
          size == 0         ? "sts.example:443 closed the connection without an answer."
          : size < headSize ? "The answer from sts.example:443 was cut off in its header."
                            : "The answer from sts.example:443 was cut off in its body.";
      EXPECT_EQ(result, expected) << size;
      EXPECT_TRUE(spec_->Streams().front()->IsClosed());
    }
  }
}

TEST_F(ExchangeTest, RefusesAnAnswerThatFailsAtAnyByte) {
  const std::string untilEnd = "HTTP/1.1 200 OK\r\n\r\nhello";
  for (const std::string& answer : {std::string(kHello), std::string(kChunkedHello), untilEnd}) {
    const std::size_t end = answer == untilEnd ? answer.size() + 1 : answer.size();
    for (std::size_t size = 0; size < end; ++size) {
      ScriptedSpec::Script script;
      script.stream.onWritten = [&](ScriptedStream& stream) {
        stream.Push(answer.substr(0, size));
        stream.PushError("Connection reset by peer");
      };
      Use(script);
      EXPECT_EQ(ExchangeOnce(), "Connection reset by peer") << size;
      EXPECT_TRUE(spec_->Streams().front()->IsClosed());
    }
  }
}

TEST_F(ExchangeTest, EndsABodyWithoutLengthAtTheEndOfTheConnection) {
  ScriptedSpec::Script script;
  script.stream.onWritten = [](ScriptedStream& stream) {
    stream.Push("HTTP/1.0 200 OK\r\n\r\nhello");
    stream.PushEnd();
  };
  Use(script);
  EXPECT_EQ(ExchangeOnce(), "hello");
  EXPECT_TRUE(spec_->Streams().front()->IsClosed());
}

TEST_F(ExchangeTest, RefusesAMalformedAnswerAndClosesTheConnection) {
  UseAnswer("HTTP/1.1 200 OK\r\nContent-Length: +5\r\n\r\nhello");
  EXPECT_EQ(ExchangeOnce(), "The answer from sts.example:443 has a malformed Content-Length.");
  EXPECT_TRUE(spec_->Streams().front()->IsClosed());
}

TEST_F(ExchangeTest, KeepsTheClassOfAFailure) {
  UseAnswer("junk");
  const auto item = Send();
  EXPECT_THROW(agent_->Wait(item.get(), kPlentyOfTime), HttpException);
}

TEST_F(ExchangeTest, AcceptsAnEarlyAnswerThatClosesBeforeTheRequestIsWritten) {
  ScriptedSpec::Script script;
  script.stream.holdWrites = true;
  Use(script);
  const auto item = Send();
  ASSERT_TRUE(Eventually([&] { return !spec_->Streams().empty(); }));
  spec_->Streams().front()->Push(
      "HTTP/1.1 413 Too Large\r\nConnection: close\r\nContent-Length: 0\r\n\r\n");
  EXPECT_EQ(agent_->Wait(item.get(), kPlentyOfTime)->Status().code, 413);
  EXPECT_TRUE(spec_->Streams().front()->IsClosed());
}

TEST_F(ExchangeTest, WaitsForItsWriteBeforeTheConnectionIsReused) {
  ScriptedSpec::Script script;
  script.stream.holdWrites = true;
  Use(script);
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record);
  ASSERT_TRUE(Eventually([&] { return !spec_->Streams().empty(); }));
  const auto stream = spec_->Streams().front();
  ASSERT_TRUE(Eventually([&] { return !stream->Written().empty(); }));
  stream->Push(kHello);
  stream->ReleaseWrite();
  EXPECT_EQ(BodyOf(*agent_->Wait(item.get(), kPlentyOfTime)), "");
  EXPECT_EQ(record->body, "hello");
  EXPECT_FALSE(stream->IsClosed());
}

enum class Stage { kConnect, kWrite, kHead, kBody };

class StalledExchangeTest : public ExchangeFixture, public testing::WithParamInterface<Stage> {
 protected:
  void SetUp() override {
    ScriptedSpec::Script script;
    script.holdConnects = GetParam() == Stage::kConnect;
    script.stream.holdWrites = GetParam() == Stage::kWrite;
    script.stream.onWritten = [](ScriptedStream& stream) {
      stream.Push(GetParam() == Stage::kHead ? "HTTP/1.1 200 OK\r\nCont"
                                             : "HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhel");
    };
    Use(script);
  }

  /// Waits until the exchange is stalled.
  bool IsStalled() {
    if (GetParam() == Stage::kConnect) {
      return spec_->ConnectCount() == 1;
    }
    return Eventually([&] { return !spec_->Streams().empty(); }) &&
           Eventually([&] { return !spec_->Streams().front()->Written().empty(); });
  }

  static std::string AwaitedText() {
    switch (GetParam()) {
      case Stage::kConnect:
        return "the connection";
      case Stage::kWrite:
        return "the request to be sent";
      default:
        return "the answer";
    }
  }

  void ExpectReleased() {
    if (GetParam() == Stage::kConnect) {
      EXPECT_EQ(spec_->CancelCount(), 1U);
      return;
    }
    EXPECT_TRUE(spec_->Streams().front()->IsClosed());
  }
};

TEST_P(StalledExchangeTest, EndsOnceWhenCancelled) {
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record);
  ASSERT_TRUE(IsStalled());
  EXPECT_TRUE(item->Cancel());
  EXPECT_FALSE(item->Cancel());
  EXPECT_THROW(agent_->Wait(item.get(), kPlentyOfTime), CancelledException);
  EXPECT_EQ(record->message, "The request to sts.example:443 was cancelled.");
  ExpectReleased();
  EXPECT_TRUE(Eventually([&] { return record.use_count() == 1; }));
  EXPECT_EQ(record->count, 1);
}

TEST_P(StalledExchangeTest, EndsOnceAtItsOwnTimeLimit) {
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record, 20000);
  EXPECT_THROW(agent_->Wait(item.get(), kPlentyOfTime), TimeoutException);
  EXPECT_THAT(record->message,
              testing::StartsWith(
                  "No answer from sts.example:443 within 20 milliseconds: waiting for the "));
  EXPECT_TRUE(Eventually([&] { return record.use_count() == 1; }));
  EXPECT_EQ(record->count, 1);
}

TEST_P(StalledExchangeTest, EndsOnceAtTheWaitersTimeLimit) {
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record);
  ASSERT_TRUE(IsStalled());
  // Long enough for the completion of the write.
  EXPECT_THROW(agent_->Wait(item.get(), 150000), TimeoutException);
  EXPECT_EQ(record->count, 1);
  EXPECT_EQ(
      record->message,
      "No answer from sts.example:443 within 150 milliseconds: waiting for " + AwaitedText() + ".");
  ExpectReleased();
  EXPECT_FALSE(item->Cancel());
}

TEST_P(StalledExchangeTest, OutlivesItsAgentAndItsHandle) {
  const auto record = std::make_shared<CompletionRecord>();
  auto item = Send(record, 20000);
  agent_ = nullptr;
  item = nullptr;
  EXPECT_TRUE(Eventually([&] { return record->count == 1; }));
  EXPECT_TRUE(Eventually([&] { return record.use_count() == 1; }));
}

INSTANTIATE_TEST_SUITE_P(Stages, StalledExchangeTest,
                         testing::Values(Stage::kConnect, Stage::kWrite, Stage::kHead,
                                         Stage::kBody));

TEST_F(ExchangeTest, EnforcesItsTimeLimitWhileBytesTrickleIn) {
  Use({});
  const auto item = Send(std::make_shared<CompletionRecord>(), 50000);
  ASSERT_TRUE(Eventually([&] { return !spec_->Streams().empty(); }));
  const auto stream = spec_->Streams().front();
  std::atomic<bool> isOver{false};
  std::thread trickle([&] {
    stream->Push("HTTP/1.1 200 OK\r\n");
    while (!isOver) {
      stream->Push("x");
      std::this_thread::sleep_for(std::chrono::milliseconds(1));
    }
  });
  EXPECT_THROW(agent_->Wait(item.get(), kPlentyOfTime), TimeoutException);
  isOver = true;
  trickle.join();
}

// The exchange may end before the start of its connect returns, and the connection may already
// serve the next exchange.
TEST_F(ExchangeTest, DoesNotCancelAConnectThatHasEnded) {
  const auto record = std::make_shared<CompletionRecord>();
  ScriptedSpec::Script script;
  script.stream.onWritten = AnswerWith(kHello);
  script.beforeStartReturns = [record] {
    EXPECT_TRUE(Eventually([&] { return record->count == 1; }));
  };
  Use(script);
  Send(record);
  EXPECT_EQ(record->body, "hello");
  EXPECT_EQ(spec_->CancelCount(), 0U);
}

TEST_F(ExchangeTest, ClosesAStreamThatIsConnectedAfterTheEnd) {
  ScriptedSpec::Script script;
  script.holdConnects = true;
  Use(script);
  const auto first = Send();
  // The connect can no longer be stopped.
  spec_->ReleaseConnect();
  first->Cancel();
  EXPECT_THROW(agent_->Wait(first.get(), kPlentyOfTime), CancelledException);
  EXPECT_TRUE(Eventually([&] { return !spec_->Streams().empty(); }));
  const auto stream = spec_->Streams().front();
  EXPECT_TRUE(Eventually([&] { return stream->IsClosed(); }));
}

struct DurationCase {
  unsigned long microseconds;
  const char* text;
};

class TimeoutMessageTest : public ExchangeFixture,
                           public testing::WithParamInterface<DurationCase> {};

TEST_P(TimeoutMessageTest, NamesTheLimit) {
  ScriptedSpec::Script script;
  script.holdConnects = true;
  Use(script);
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record, GetParam().microseconds);
  EXPECT_THROW(agent_->Wait(item.get(), 0), TimeoutException);
  EXPECT_EQ(record->message, std::string("No answer from sts.example:443 within ") +
                                 GetParam().text + ": waiting for the connection.");
}

INSTANTIATE_TEST_SUITE_P(Durations, TimeoutMessageTest,
                         testing::Values(DurationCase{1, "1 microseconds"},
                                         DurationCase{1000, "1 milliseconds"},
                                         DurationCase{1001, "1001 microseconds"},
                                         DurationCase{1000000, "1 second"}));

TEST_F(ExchangeTest, WaitsForeverWithALimitBeyondTheClock) {
  UseAnswer(kHello);
  const auto item = Send();
  EXPECT_EQ(agent_->Wait(item.get(), ~0UL)->Status().code, 200);
}

// The completion, the time limit and a cancel may come in any order; exactly one of them wins.
TEST(ExchangeConcurrencyTest, EndsExactlyOnceInEveryRace) {
  ScriptedSpec::Script script;
  script.stream.pieceSize = 7;
  script.stream.onWritten = AnswerWith(kHello);
  const auto spec = MakeRef<ScriptedSpec>(script);
  const auto agent = CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  for (int i = 0; i < 300; ++i) {
    const auto record = std::make_shared<CompletionRecord>();
    const auto item = agent->SendAsync(PostRequest().get(), RecordIn(record), 1 + i % 40);
    std::thread canceller([&] { item->Cancel(); });
    bool hasFailed = false;
    try {
      agent->Wait(item.get(), 1 + i % 30);
    } catch (const IOException&) {
      hasFailed = true;
    }
    canceller.join();
    EXPECT_EQ(record->count, 1);
    EXPECT_EQ(record->responseCount, hasFailed ? 0 : 1);
    spec->ForgetStreams();
  }
}

TEST(ExchangeConcurrencyTest, RunsAThousandExchangesAtOnce) {
  constexpr int kCount = 1000;
  ScriptedSpec::Script script;
  const auto spec = MakeRef<ScriptedSpec>(script);
  const auto agent = CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  const auto record = std::make_shared<CompletionRecord>();
  std::atomic<int> answered{0};
  std::vector<Ref<PendingRequestItem>> items;
  for (int i = 0; i < kCount; ++i) {
    items.push_back(agent->SendAsync(
        PostRequest().get(),
        [&answered](Exception*, ClientResponse* response, PendingRequestItem*) {
          answered += response != nullptr && BodyOf(*response) == "hello" ? 1 : 0;
        },
        kPlentyOfTime));
  }
  // All are pending before the first is answered.
  ASSERT_TRUE(Eventually([&] { return spec->Streams().size() == kCount; }));
  EXPECT_EQ(answered, 0);
  for (const auto& stream : spec->Streams()) {
    stream->Push(kHello);
  }
  for (const auto& item : items) {
    agent->Wait(item.get(), kPlentyOfTime);
  }
  EXPECT_EQ(answered, kCount);
}

}  // namespace
}  // namespace Tarnik::Testing
