#include "end_to_end/token_calls.h"

#include <condition_variable>
#include <deque>
#include <mutex>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>

namespace SsoClient::Access::Testing {

namespace {

void Note(Result& result, const std::exception& failure) {
  result.type = typeid(failure).name();
  result.message = failure.what();
}

}  // namespace

Result Get(TokenSource& source, const TokenSpec& spec, const CallContext& context) {
  Result result;
  try {
    result.token = source.GetToken(spec, context);
  } catch (const std::exception& failure) {
    Note(result, failure);
  }
  result.ended = std::chrono::steady_clock::now();
  result.reports = 1;
  return result;
}

struct TokenCalls::State {
  std::mutex mutex;
  std::condition_variable changed;
  std::deque<Result> results;
  std::size_t reported = 0;
};

TokenCalls::TokenCalls() : state_(std::make_shared<State>()) {}

void TokenCalls::Begin(TokenSource& source, const TokenSpec& spec, const CallContext& context) {
  Result* result = nullptr;
  {
    const std::lock_guard lock(state_->mutex);
    result = &state_->results.emplace_back();
  }
  ++size_;
  source.GetTokenAsync(spec, context,
                       [state = state_, result](const std::shared_ptr<const SamlToken>& token,
                                                const Tarnik::Exception* failure) {
                         const auto now = std::chrono::steady_clock::now();
                         const std::lock_guard lock(state->mutex);
                         result->token = token;
                         result->ended = now;
                         if (failure != nullptr) {
                           Note(*result, *failure);
                         }
                         state->reported += ++result->reports == 1 ? 1 : 0;
                         state->changed.notify_all();
                       });
}

std::vector<Result> TokenCalls::Wait() const {
  std::unique_lock lock(state_->mutex);
  EXPECT_TRUE(state_->changed.wait_for(lock, std::chrono::minutes(1),
                                       [this] { return state_->reported == size_; }))
      << state_->reported << " of " << size_ << " calls have reported";
  return {state_->results.begin(), state_->results.end()};
}

std::size_t TokenCalls::Reported() const {
  const std::lock_guard lock(state_->mutex);
  return state_->reported;
}

TokenSpec SpecFor(const std::string& audience) {
  TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  spec.audienceRestriction = {audience};
  return spec;
}

TokenSpec SpecFor(std::size_t number) {
  return SpecFor("https://audience-" + std::to_string(number) + ".example.com");
}

}  // namespace SsoClient::Access::Testing
