#ifndef SSOCLIENT_TESTS_TRANSPORT_CONNECT_RECORDER_H
#define SSOCLIENT_TESTS_TRANSPORT_CONNECT_RECORDER_H

#include <chrono>
#include <future>
#include <memory>
#include <stdexcept>
#include <string>
#include <thread>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/http/connection_spec.h>
#include <tarnik/system/stream.h>

namespace SsoClient::Testing {

/// Records the arguments of a connection's completion. It waits until the last copy of the
/// completion is destroyed, so that a second call cannot go unnoticed.
class ConnectRecorder {
 public:
  Tarnik::Http::CustomConnectionSpec::ConnectCompletion Completion() {
    auto token = std::make_shared<Token>(gone_);
    return [this, token](Tarnik::System::Stream* stream, Tarnik::Exception* error) {
      ++calls;
      isOnCallersThread = std::this_thread::get_id() == caller_;
      lastStream = stream;
      hasError = error != nullptr;
      if (error != nullptr) {
        message = error->Message();
        isCancelled = dynamic_cast<Tarnik::CancelledException*>(error) != nullptr;
      }
    };
  }

  void Wait() {
    if (future_.wait_for(std::chrono::seconds(20)) != std::future_status::ready) {
      throw std::runtime_error("the completion was not dropped");
    }
  }

  int calls = 0;
  Tarnik::Ref<Tarnik::System::Stream> lastStream;
  bool isOnCallersThread = false;
  bool hasError = false;
  bool isCancelled = false;
  std::string message;

 private:
  class Token {
   public:
    explicit Token(std::shared_ptr<std::promise<void>> gone) : gone_(std::move(gone)) {}
    Token(const Token&) = delete;
    Token& operator=(const Token&) = delete;
    ~Token() { gone_->set_value(); }

   private:
    std::shared_ptr<std::promise<void>> gone_;
  };

  std::thread::id caller_ = std::this_thread::get_id();
  std::shared_ptr<std::promise<void>> gone_ = std::make_shared<std::promise<void>>();
  std::future<void> future_ = gone_->get_future();
};

}  // namespace SsoClient::Testing

#endif
