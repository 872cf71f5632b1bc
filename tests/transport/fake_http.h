#ifndef SSOCLIENT_TESTS_TRANSPORT_FAKE_HTTP_H
#define SSOCLIENT_TESTS_TRANSPORT_FAKE_HTTP_H

#include <functional>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/http_response.h>
#include <tarnik/http/http_user_agent.h>

namespace SsoClient::Testing {

class FakeResponse final : public Tarnik::Http::ClientResponse, public Tarnik::ObjectImpl {
 public:
  FakeResponse(int code, std::string reason, const std::string& body = {})
      : status_{code, std::move(reason)}, body_(Tarnik::CreateStringReader(body)) {}

  const Tarnik::Http::StatusLine& Status() const override { return status_; }
  std::optional<std::string> Header(const std::string&) const override { return std::nullopt; }
  Tarnik::Ref<Tarnik::Reader> Body() const override {
    if (bodyFailure) {
      throw Tarnik::IOException(*bodyFailure);
    }
    return body_;
  }

  std::optional<std::string> bodyFailure;

 private:
  Tarnik::Http::StatusLine status_;
  Tarnik::Ref<Tarnik::Reader> body_;
};

class FakePendingItem final : public Tarnik::Http::PendingRequestItem, public Tarnik::ObjectImpl {
 public:
  bool Cancel() override { return true; }
};

/// Records its arguments. `Wait` calls `onWait`, which returns or throws its result.
class FakeUserAgent final : public Tarnik::Http::UserAgent, public Tarnik::ObjectImpl {
 public:
  Tarnik::Ref<Tarnik::Http::PendingRequestItem> SendAsync(
      Tarnik::Http::ClientRequest*, Completion completion,
      unsigned long timeoutMicroseconds) override {
    if (onSend) {
      onSend();
    }
    completions.push_back(std::move(completion));
    sendTimeouts.push_back(timeoutMicroseconds);
    return item;
  }

  Tarnik::Ref<Tarnik::Http::ClientResponse> Wait(Tarnik::Http::PendingRequestItem* waitedItem,
                                                 unsigned long timeoutMicroseconds) override {
    waitedItems.push_back(waitedItem);
    waitTimeouts.push_back(timeoutMicroseconds);
    return onWait();
  }

  std::function<void()> onSend;
  std::function<Tarnik::Ref<Tarnik::Http::ClientResponse>()> onWait = [] {
    return Tarnik::MakeRef<FakeResponse>(200, "OK", "answer");
  };
  Tarnik::Ref<FakePendingItem> item = Tarnik::MakeRef<FakePendingItem>();
  std::vector<Completion> completions;
  std::vector<unsigned long> sendTimeouts;
  std::vector<unsigned long> waitTimeouts;
  std::vector<Tarnik::Http::PendingRequestItem*> waitedItems;
};

}  // namespace SsoClient::Testing

#endif
