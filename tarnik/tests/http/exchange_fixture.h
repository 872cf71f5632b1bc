#ifndef TARNIK_TESTS_HTTP_EXCHANGE_FIXTURE_H
#define TARNIK_TESTS_HTTP_EXCHANGE_FIXTURE_H

#include <gtest/gtest.h>
#include <tarnik/http/http_exception.h>
#include <tarnik/http/http_user_agent.h>

#include <atomic>
#include <chrono>
#include <memory>
#include <string>
#include <thread>

#include "support/outcome.h"
#include "support/scripted_spec.h"

namespace Tarnik::Http {

using Testing::AnswerWith;
using Testing::ScriptedSpec;
using Testing::ScriptedStream;

inline constexpr unsigned long kSecond = 1000000;
inline constexpr unsigned long kPlentyOfTime = 60 * kSecond;
inline constexpr const char* kHello = "HTTP/1.1 200 OK\r\nContent-Length: 5\r\n\r\nhello";

inline std::string BodyOf(const ClientResponse& response) {
  std::string body;
  char buffer[1000];
  while (const std::size_t count = response.Body()->Read(buffer, sizeof(buffer))) {
    body.append(buffer, count);
  }
  return body;
}

inline Ref<ClientRequest> PostRequest(const std::string& body = "<a/>",
                                      const std::string& target = "/sts") {
  Ref<ClientRequest> request;
  CreateHttpRequest(Method::POST, target, request);
  request->BodyWriter()->Write(body);
  return request;
}

/// Waits until `condition` holds; false when it does not within the tests' patience.
template <class Condition>
bool Eventually(Condition condition) {
  const auto end = std::chrono::steady_clock::now() + Testing::kPatience;
  while (!condition()) {
    if (std::chrono::steady_clock::now() > end) {
      return false;
    }
    std::this_thread::yield();
  }
  return true;
}

/// What the completion of one exchange was told.
struct Heard {
  std::atomic<int> count{0};
  std::atomic<int> responseCount{0};
  std::string message;
  std::string body;
  PendingRequestItem* item = nullptr;
};

inline UserAgent::Completion Hear(const std::shared_ptr<Heard>& heard) {
  return [heard](Exception* exception, ClientResponse* response, PendingRequestItem* item) {
    heard->message = exception == nullptr ? std::string() : exception->Message();
    heard->body = response == nullptr ? std::string() : BodyOf(*response);
    heard->item = item;
    heard->responseCount += response == nullptr ? 0 : 1;
    EXPECT_NE(exception == nullptr, response == nullptr);
    ++heard->count;
  };
}

/// An agent over scripted streams. Checks in the end that no stream has been leaked.
class ExchangeFixture : public testing::Test {
 protected:
  void TearDown() override {
    agent_ = nullptr;
    spec_ = nullptr;
    EXPECT_TRUE(Eventually([] { return ScriptedStream::LiveCount() == 0; }))
        << ScriptedStream::LiveCount() << " streams are left";
  }

  void Use(ScriptedSpec::Script script, CookieStore* cookies = nullptr,
           ConnectionPool* pool = nullptr) {
    spec_ = MakeRef<ScriptedSpec>(std::move(script));
    agent_ = CreateHttpUserAgent(spec_.get(), cookies, pool);
  }

  /// The usual case: every stream answers `answer` to each request.
  void UseAnswer(const std::string& answer) {
    ScriptedSpec::Script script;
    script.stream.onWritten = AnswerWith(answer);
    Use(script);
  }

  Ref<PendingRequestItem> Send(const std::shared_ptr<Heard>& heard = std::make_shared<Heard>(),
                               unsigned long timeout = 0) {
    return agent_->SendAsync(PostRequest().get(), Hear(heard), timeout);
  }

  /// Sends a request and gives the body of its answer, or the message of its failure.
  std::string Exchanged() {
    const auto heard = std::make_shared<Heard>();
    const auto item = Send(heard);
    std::string result;
    try {
      agent_->Wait(item.get(), kPlentyOfTime);
      result = heard->body;
    } catch (const Exception& exception) {
      result = exception.Message();
      EXPECT_EQ(heard->message, result);
    }
    EXPECT_EQ(heard->count, 1);
    EXPECT_EQ(heard->item, item.get());
    return result;
  }

  Ref<ScriptedSpec> spec_;
  Ref<UserAgent> agent_;
};

}  // namespace Tarnik::Http

#endif
