#ifndef TARNIK_TESTS_HTTP_EXCHANGE_FIXTURE_H
#define TARNIK_TESTS_HTTP_EXCHANGE_FIXTURE_H

#include <atomic>
#include <chrono>
#include <memory>
#include <string>
#include <thread>
#include <utility>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/http/cookie_store.h>
#include <tarnik/http/http_request.h>
#include <tarnik/http/http_response.h>
#include <tarnik/http/http_user_agent.h>

#include "http/response_body.h"
#include "support/outcome.h"
#include "support/scripted_spec.h"
#include "support/scripted_stream.h"

namespace Tarnik::Testing {

inline constexpr unsigned long kSecond = 1000000;
inline constexpr unsigned long kPlentyOfTime = 60 * kSecond;
inline constexpr const char* kHello = "HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhello";

inline Ref<Http::ClientRequest> PostRequest(const std::string& body = "<a/>",
                                            const std::string& target = "/sts") {
  Ref<Http::ClientRequest> request;
  Http::CreateHttpRequest(Http::Method::POST, target, request);
  request->BodyWriter()->Write(body);
  return request;
}

/// Waits until `condition` holds; returns false if it does not within `kPatience`.
template <class Condition>
bool Eventually(Condition condition) {
  const auto end = std::chrono::steady_clock::now() + kPatience;
  while (!condition()) {
    if (std::chrono::steady_clock::now() > end) {
      return false;
    }
    std::this_thread::yield();
  }
  return true;
}

/// What the completion of one exchange has received.
struct CompletionRecord {
  std::atomic<int> count{0};
  std::atomic<int> responseCount{0};
  std::string message;
  std::string body;
  Http::PendingRequestItem* item = nullptr;
};

inline Http::UserAgent::Completion RecordIn(const std::shared_ptr<CompletionRecord>& record) {
  return [record](Exception* exception, Http::ClientResponse* response,
                  Http::PendingRequestItem* item) {
    record->message = exception == nullptr ? std::string() : exception->Message();
    record->body = response == nullptr ? std::string() : BodyOf(*response);
    record->item = item;
    record->responseCount += response == nullptr ? 0 : 1;
    EXPECT_NE(exception == nullptr, response == nullptr);
    ++record->count;
  };
}

/// An agent over scripted streams. Checks at the end that no stream has leaked.
class ExchangeFixture : public testing::Test {
 protected:
  void TearDown() override {
    agent_ = nullptr;
    spec_ = nullptr;
    EXPECT_TRUE(Eventually([] { return ScriptedStream::LiveCount() == 0; }))
        << ScriptedStream::LiveCount() << " streams are left";
  }

  void Use(ScriptedSpec::Script script, Http::CookieStore* cookies = nullptr,
           Http::ConnectionPool* pool = nullptr) {
    spec_ = MakeRef<ScriptedSpec>(std::move(script));
    agent_ = Http::CreateHttpUserAgent(spec_.get(), cookies, pool);
  }

  /// The usual case: every stream answers `answer` to each request.
  void UseAnswer(const std::string& answer) {
    ScriptedSpec::Script script;
    script.stream.onWritten = AnswerWith(answer);
    Use(script);
  }

  Ref<Http::PendingRequestItem> Send(
      const std::shared_ptr<CompletionRecord>& record = std::make_shared<CompletionRecord>(),
      unsigned long timeout = 0) {
    return agent_->SendAsync(PostRequest().get(), RecordIn(record), timeout);
  }

  /// Sends a request and returns the body of its answer, or the message of its failure.
  std::string ExchangeOnce() {
    const auto record = std::make_shared<CompletionRecord>();
    const auto item = Send(record);
    std::string result;
    try {
      agent_->Wait(item.get(), kPlentyOfTime);
      result = record->body;
    } catch (const Exception& exception) {
      result = exception.Message();
      EXPECT_EQ(record->message, result);
    }
    EXPECT_EQ(record->count, 1);
    EXPECT_EQ(record->item, item.get());
    return result;
  }

  Ref<ScriptedSpec> spec_;
  Ref<Http::UserAgent> agent_;
};

}  // namespace Tarnik::Testing

#endif
