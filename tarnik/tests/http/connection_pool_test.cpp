#include <algorithm>
#include <atomic>
#include <chrono>
#include <cstddef>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/http/http_response.h>
#include <tarnik/http/http_user_agent.h>

#include "http/exchange_fixture.h"
#include "http/idle_connections.h"
#include "support/scripted_spec.h"
#include "support/scripted_stream.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

class ConnectionPoolTest : public ExchangeFixture {
 protected:
  /// Runs `count` exchanges at once, each on its own connection, and then completes them.
  void ExchangeAtOnce(std::size_t count) {
    const std::size_t before = spec_->Streams().size();
    std::vector<Ref<PendingRequestItem>> items;
    for (std::size_t i = 0; i < count; ++i) {
      items.push_back(Send());
    }
    ASSERT_TRUE(Eventually([&] { return spec_->Streams().size() == before + count; }));
    for (const auto& stream : spec_->Streams()) {
      stream->Push(kHello);
    }
    for (const auto& item : items) {
      agent_->Wait(item.get(), kPlentyOfTime);
    }
  }

  std::size_t OpenCount() {
    const auto streams = spec_->Streams();
    return static_cast<std::size_t>(std::count_if(
        streams.begin(), streams.end(), [](const auto& stream) { return !stream->IsClosed(); }));
  }
};

TEST_F(ConnectionPoolTest, ReusesAConnection) {
  UseAnswer(kHello);
  for (int i = 0; i < 20; ++i) {
    EXPECT_EQ(ExchangeOnce(), "hello");
  }
  EXPECT_EQ(spec_->ConnectCount(), 1U);
}

TEST_F(ConnectionPoolTest, ReusesAConnectionFromWithinTheCompletion) {
  UseAnswer(kHello);
  const auto inner = std::make_shared<CompletionRecord>();
  const auto item = agent_->SendAsync(
      PostRequest().get(), [&](Exception*, ClientResponse*, PendingRequestItem*) { Send(inner); },
      0);
  agent_->Wait(item.get(), kPlentyOfTime);
  EXPECT_TRUE(Eventually([&] { return inner->count == 1; }));
  EXPECT_EQ(inner->body, "hello");
  EXPECT_EQ(spec_->ConnectCount(), 1U);
}

class ConnectionPoolSingleUseAnswerTest : public ConnectionPoolTest,
                                          public testing::WithParamInterface<const char*> {};

TEST_P(ConnectionPoolSingleUseAnswerTest, IsTheLastOfItsConnection) {
  ScriptedSpec::Script script;
  script.stream.onWritten = [](ScriptedStream& stream) {
    stream.Push(GetParam());
    stream.PushEnd();
  };
  Use(script);
  EXPECT_EQ(ExchangeOnce(), "hello");
  EXPECT_EQ(ExchangeOnce(), "hello");
  EXPECT_EQ(spec_->ConnectCount(), 2U);
  EXPECT_EQ(OpenCount(), 0U);
}

INSTANTIATE_TEST_SUITE_P(
    Answers, ConnectionPoolSingleUseAnswerTest,
    testing::Values("HTTP/1.1 200 OK\r\nConnection: close\r\nContent-Length: 5\r\n\r\nhello",
                    "HTTP/1.0 200 OK\r\nContent-Length: 5\r\n\r\nhello",
                    "HTTP/1.1 200 OK\r\n\r\nhello",
                    "HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhelloHTTP/1.1 200 OK\r\n"));

TEST_F(ConnectionPoolTest, DropsAnIdleConnectionThatThePeerCloses) {
  UseAnswer(kHello);
  ExchangeOnce();
  const auto stream = spec_->Streams().front();
  stream->PushEnd();
  EXPECT_TRUE(Eventually([&] { return stream->IsClosed(); }));
  EXPECT_EQ(ExchangeOnce(), "hello");
  EXPECT_EQ(spec_->ConnectCount(), 2U);
}

TEST_F(ConnectionPoolTest, DropsAnIdleConnectionThatFails) {
  UseAnswer(kHello);
  ExchangeOnce();
  const auto stream = spec_->Streams().front();
  stream->PushError("Connection reset by peer");
  EXPECT_TRUE(Eventually([&] { return stream->IsClosed(); }));
}

TEST_F(ConnectionPoolTest, DropsAnIdleConnectionWithAnUnsolicitedAnswer) {
  UseAnswer(kHello);
  ExchangeOnce();
  const auto stream = spec_->Streams().front();
  stream->Push("HTTP/1.1 200 OK\r\nContent-Length: 4\r\n\r\nevil");
  EXPECT_TRUE(Eventually([&] { return stream->IsClosed(); }));
  EXPECT_EQ(ExchangeOnce(), "hello");
}

TEST_F(ConnectionPoolTest, NeverSendsARequestTwice) {
  ScriptedSpec::Script script;
  script.stream.onWritten = [](ScriptedStream& stream) {
    const std::string written = stream.Written();
    if (written.find("POST", 1) == std::string::npos) {
      stream.Push(kHello);
      return;
    }
    stream.PushEnd();
  };
  Use(script);
  EXPECT_EQ(ExchangeOnce(), "hello");
  EXPECT_EQ(ExchangeOnce(), "sts.example:443 closed the connection without an answer.");
  EXPECT_EQ(spec_->ConnectCount(), 1U);
}

TEST_F(ConnectionPoolTest, ClosesIdleConnectionsWithTheAgent) {
  UseAnswer(kHello);
  ExchangeOnce();
  const auto stream = spec_->Streams().front();
  EXPECT_FALSE(stream->IsClosed());
  agent_ = nullptr;
  EXPECT_TRUE(stream->IsClosed());
}

TEST_F(ConnectionPoolTest, ClosesAConnectionThatBecomesFreeAfterTheAgentIsGone) {
  Use({});
  const auto record = std::make_shared<CompletionRecord>();
  const auto item = Send(record);
  ASSERT_TRUE(Eventually([&] { return !spec_->Streams().empty(); }));
  agent_ = nullptr;
  spec_->Streams().front()->Push(kHello);
  EXPECT_TRUE(Eventually([&] { return record->count == 1; }));
  EXPECT_EQ(record->body, "hello");
  EXPECT_TRUE(spec_->Streams().front()->IsClosed());
}

TEST_F(ConnectionPoolTest, KeepsEightIdleConnectionsPerEndpoint) {
  Use({});
  ExchangeAtOnce(12);
  EXPECT_EQ(OpenCount(), kMaxIdlePerEndpoint);
}

TEST_F(ConnectionPoolTest, KeepsSixtyFourIdleConnectionsInTotal) {
  const auto pool = CreateConnectionPool();
  std::vector<Ref<ScriptedSpec>> specs;
  for (int i = 0; i < 9; ++i) {
    Use({}, nullptr, pool.get());
    specs.push_back(spec_);
    ExchangeAtOnce(8);
  }
  std::size_t open = 0;
  for (const auto& spec : specs) {
    spec_ = spec;
    open += OpenCount();
  }
  EXPECT_EQ(open, kMaxIdle);
}

TEST_F(ConnectionPoolTest, IsSharedByAgentsOfOneSpec) {
  const auto pool = CreateConnectionPool();
  ScriptedSpec::Script script;
  script.stream.onWritten = AnswerWith(kHello);
  Use(script, nullptr, pool.get());
  ExchangeOnce();
  agent_ = CreateHttpUserAgent(spec_.get(), nullptr, pool.get());
  ExchangeOnce();
  EXPECT_EQ(spec_->ConnectCount(), 1U);
}

TEST_F(ConnectionPoolTest, SeparatesConnectionsOfDifferentSpecs) {
  const auto pool = CreateConnectionPool();
  ScriptedSpec::Script script;
  script.stream.onWritten = AnswerWith(kHello);
  Use(script, nullptr, pool.get());
  ExchangeOnce();
  // The same endpoint, but the trust settings may differ.
  Use(script, nullptr, pool.get());
  ExchangeOnce();
  EXPECT_EQ(spec_->ConnectCount(), 1U);
}

TEST_F(ConnectionPoolTest, ClosesAConnectionThatIsIdleForTooLong) {
  UseAnswer(kHello);
  ExchangeOnce();
  const auto stream = spec_->Streams().front();
  EXPECT_FALSE(stream->IsClosed());
  EXPECT_TRUE(Eventually([&] {
    std::this_thread::sleep_for(std::chrono::milliseconds(20));
    return stream->IsClosed();
  }));
}

TEST(ConnectionPoolConcurrencyTest, ServesManyThreads) {
  ScriptedSpec::Script script;
  script.stream.onWritten = AnswerWith(kHello);
  const auto spec = MakeRef<ScriptedSpec>(script);
  const auto agent = CreateHttpUserAgent(spec.get(), nullptr, nullptr);
  std::atomic<int> answered{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 8; ++t) {
    threads.emplace_back([&] {
      for (int i = 0; i < 50; ++i) {
        const auto item = agent->SendAsync(
            PostRequest().get(), RecordIn(std::make_shared<CompletionRecord>()), kPlentyOfTime);
        answered += agent->Wait(item.get(), kPlentyOfTime)->Status().code == 200 ? 1 : 0;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(answered, 400);
  EXPECT_LE(spec->ConnectCount(), 8U);
}

}  // namespace
}  // namespace Tarnik::Testing
