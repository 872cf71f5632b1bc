#ifndef SSOCLIENT_TESTS_CHAOS_REPORTED_CALL_H
#define SSOCLIENT_TESTS_CHAOS_REPORTED_CALL_H

#include <atomic>
#include <functional>
#include <future>
#include <memory>

#include "chaos/run.h"
#include "integration/operation.h"

namespace SsoClient::Testing {

/// An asynchronous operation whose callback is counted.
class ReportedCall {
 public:
  /// `onCallback` runs first in the callback.
  explicit ReportedCall(std::function<void()> onCallback);

  /// Starts the operation; passes on what that throws. `arguments.token` must stay alive until the
  /// callback has run.
  void Start(Operation operation, const SecurityTokenService& service, const Arguments& arguments);
  Outcome Wait();
  /// How often the callback has run.
  int Callbacks() const { return state_->callbacks; }

 private:
  struct State {
    std::function<void()> onCallback;
    std::atomic<int> callbacks{0};
    std::promise<Outcome> outcome;
  };

  template <class Result>
  static void Report(State& state, const Result& result, const Tarnik::Exception* error);

  // Shared with the callback, which may return after the outcome is known.
  const std::shared_ptr<State> state_ = std::make_shared<State>();
};

/// Performs an operation, synchronously or not, and requires that a callback runs once, or not at
/// all when the start of the operation throws a `ResourceException`.
Outcome Perform(const Run& run, Operation operation, bool isAsync,
                const SecurityTokenService& service, const Arguments& arguments);

}  // namespace SsoClient::Testing

#endif
