#include "chaos/reported_call.h"

#include <optional>
#include <type_traits>
#include <typeinfo>
#include <utility>

namespace SsoClient::Testing {

ReportedCall::ReportedCall(std::function<void()> onCallback) {
  state_->onCallback = std::move(onCallback);
}

template <class Result>
void ReportedCall::Report(State& state, const Result& result, const Tarnik::Exception* error) {
  state.onCallback();
  if (++state.callbacks > 1) {
    return;
  }
  Outcome outcome;
  if (error != nullptr) {
    outcome.errorClass = typeid(*error);
    outcome.message = error->Message();
  }
  if constexpr (std::is_same_v<Result, boost::optional<bool>>) {
    outcome.verdict = result ? std::optional(*result) : std::nullopt;
  } else {
    outcome.token = result;
  }
  state.outcome.set_value(std::move(outcome));
}

void ReportedCall::Start(Operation operation, const SecurityTokenService& service,
                         const Arguments& arguments) {
  StartAsync(operation, service, arguments,
             [state = state_](const auto& result, const Tarnik::Exception* error) {
               Report(*state, result, error);
             });
}

Outcome ReportedCall::Wait() {
  return state_->outcome.get_future().get();
}

Outcome Perform(const Run& run, Operation operation, bool isAsync,
                const SecurityTokenService& service, const Arguments& arguments) {
  if (!isAsync) {
    return CallNow(operation, service, arguments);
  }
  ReportedCall call([] {});
  try {
    call.Start(operation, service, arguments);
  } catch (const Tarnik::ResourceException& refusal) {
    run.Require(call.Callbacks() == 0, "the call threw and reported to its callback");
    return {nullptr, std::nullopt, typeid(refusal), refusal.Message()};
  }
  Outcome outcome = call.Wait();
  run.Require(call.Callbacks() == 1, "the callback did not run once");
  return outcome;
}

}  // namespace SsoClient::Testing
