#ifndef SSOCLIENT_ACCESS_AWAITABLE_H
#define SSOCLIENT_ACCESS_AWAITABLE_H

#if __cplusplus < 202002L
#error "ssoclient/access/awaitable.h needs C++20"
#endif

#include <chrono>
#include <coroutine>
#include <memory>
#include <new>
#include <utility>

#include <ssoclient/access/token_source.h>

namespace SsoClient::Access {

/// What `AwaitToken` returns. Can be awaited once, as a temporary.
class TokenAwaitable {
 public:
  class Awaiter;

  /// A call that begins when it is awaited. `source` must not be null.
  TokenAwaitable(std::shared_ptr<TokenSource> source, TokenSpec spec, CallContext context)
      : source_(std::move(source)), spec_(std::move(spec)), context_(std::move(context)) {}

  /// Makes the awaiter, which takes over the arguments.
  Awaiter operator co_await() &&;

 private:
  std::shared_ptr<TokenSource> source_;
  TokenSpec spec_;
  CallContext context_;
};

/// The awaiter of one call (C++20, section 7.6.2.3). The compiler calls its functions; they have
/// the effects that `AwaitToken` describes.
class TokenAwaitable::Awaiter {
 public:
  /// Keeps the arguments of the call.
  Awaiter(std::shared_ptr<TokenSource> source, TokenSpec spec, CallContext context)
      : source_(std::move(source)), spec_(std::move(spec)), context_(std::move(context)) {}
  Awaiter(const Awaiter&) = delete;
  Awaiter& operator=(const Awaiter&) = delete;

  /// True when the token comes from the cache, so that the coroutine need not suspend.
  bool await_ready() {
    if (MayTakeFromCache()) {
      token_ = source_->TryGetToken(spec_);
    }
    return token_ != nullptr;
  }
  /// Begins the call, which resumes `caller` when it has ended. Throws what
  /// `TokenSource::GetTokenAsync` throws.
  void await_suspend(std::coroutine_handle<> caller) {
    // The coroutine, and with it this object, may end before the call returns.
    const auto source = source_;
    const TokenSpec spec = std::move(spec_);
    const CallContext context = std::move(context_);
    source->GetTokenAsync(spec, context,
                          [this, caller](const std::shared_ptr<const SamlToken>& token,
                                         const Tarnik::Exception* failure) {
                            token_ = token;
                            Keep(failure);
                            caller.resume();
                          });
  }
  /// Returns the token, or throws the exception of the call as its exact class.
  std::shared_ptr<const SamlToken> await_resume() {
    if (hasNoMemory_) {
      Tarnik::OutOfMemory().Throw();
    }
    if (failure_ != nullptr) {
      failure_->Throw();
    }
    return std::move(token_);
  }

 private:
  /// Otherwise `TokenSource::GetTokenAsync` decides.
  bool MayTakeFromCache() const noexcept {
    return context_.minimumLife == std::chrono::seconds(0) &&
           !context_.cancellation.IsCancelled() &&
           (context_.deadline == CallContext::Clock::time_point::max() ||
            context_.deadline > CallContext::Clock::now());
  }
  void Keep(const Tarnik::Exception* failure) noexcept {
    if (failure == nullptr) {
      return;
    }
    try {
      failure_ = failure->Clone();
    } catch (const std::bad_alloc&) {
      hasNoMemory_ = true;
    }
  }

  std::shared_ptr<TokenSource> source_;
  TokenSpec spec_;
  CallContext context_;
  std::shared_ptr<const SamlToken> token_;
  std::unique_ptr<Tarnik::Throwable> failure_;
  bool hasNoMemory_ = false;
};

inline TokenAwaitable::Awaiter TokenAwaitable::operator co_await() && {
  return Awaiter(std::move(source_), std::move(spec_), std::move(context_));
}

/// Returns a token as `TokenSource::GetToken` does, or throws what that throws, in a coroutine:
///
///     const auto token = co_await AwaitToken(source, spec);
///
/// If the token is in the cache, the coroutine does not suspend. Otherwise it continues on a worker
/// thread of the platform's pool, where it may block; an exception that leaves it there ends the
/// process. When `TokenSource::GetTokenAsync` itself throws, the coroutine continues at once, on
/// its own thread, with that exception.
[[nodiscard]] inline TokenAwaitable AwaitToken(std::shared_ptr<TokenSource> source, TokenSpec spec,
                                               CallContext context = {}) {
  return TokenAwaitable(std::move(source), std::move(spec), std::move(context));
}

}  // namespace SsoClient::Access

#endif
