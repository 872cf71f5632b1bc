#ifndef SSOCLIENT_ACCESS_AWAITABLE_H
#define SSOCLIENT_ACCESS_AWAITABLE_H

#if __cplusplus < 202002L
#error "ssoclient/access/awaitable.h needs C++20"
#endif

#include <coroutine>
#include <memory>
#include <utility>

#include <ssoclient/access/token_source.h>

namespace SsoClient::Access {

/// What `AwaitToken` returns: `co_await` it once.
class TokenAwaitable {
 public:
  TokenAwaitable(TokenSource& source, TokenSpec spec, CallContext context)
      : source_(&source), spec_(std::move(spec)), context_(std::move(context)) {}
  TokenAwaitable(const TokenAwaitable&) = delete;
  TokenAwaitable& operator=(const TokenAwaitable&) = delete;

  bool await_ready() const noexcept { return false; }
  void await_suspend(std::coroutine_handle<> caller) {
    // The coroutine, and with it this object, may end before the call returns.
    const TokenSpec spec = std::move(spec_);
    const CallContext context = std::move(context_);
    source_->GetTokenAsync(spec, context,
                           [this, caller](const std::shared_ptr<const SamlToken>& token,
                                          const Tarnik::Exception* failure) {
                             token_ = token;
                             if (failure != nullptr) {
                               failure_ = failure->Clone();
                             }
                             caller.resume();
                           });
  }
  std::shared_ptr<const SamlToken> await_resume() {
    if (failure_ != nullptr) {
      failure_->Throw();
    }
    return std::move(token_);
  }

 private:
  TokenSource* source_;
  TokenSpec spec_;
  CallContext context_;
  std::shared_ptr<const SamlToken> token_;
  std::unique_ptr<Tarnik::Throwable> failure_;
};

/// Returns a token as `TokenSource::GetToken` does, or throws what that throws, in a coroutine:
///
///     const auto token = co_await AwaitToken(*source, spec);
///
/// The coroutine continues on a worker thread of the platform's pool, where it may block; an
/// exception that leaves it there ends the process. `source` must exist until then.
[[nodiscard]] inline TokenAwaitable AwaitToken(TokenSource& source, TokenSpec spec,
                                               CallContext context = {}) {
  return TokenAwaitable(source, std::move(spec), std::move(context));
}

}  // namespace SsoClient::Access

#endif
