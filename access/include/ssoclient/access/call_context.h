#ifndef SSOCLIENT_ACCESS_CALL_CONTEXT_H
#define SSOCLIENT_ACCESS_CALL_CONTEXT_H

#include <chrono>
#include <functional>
#include <memory>

#include <ssoclient/access/export.h>

namespace SsoClient::Access {

/// Keeps a function registered with a `CancellationToken`. Movable. Its destructor removes the
/// function; when the function is running on another thread, it waits until that has returned.
class SSOCLIENT_ACCESS_EXPORT CancellationRegistration {
 public:
  CancellationRegistration() noexcept;
  CancellationRegistration(CancellationRegistration&& other) noexcept;
  CancellationRegistration& operator=(CancellationRegistration&& other) noexcept;
  ~CancellationRegistration();

 private:
  friend class CancellationToken;
  class State;
  explicit CancellationRegistration(std::unique_ptr<State> state) noexcept;
  std::unique_ptr<State> state_;
};

/// Reports that the caller has given up. A copy refers to the same `CancellationSource`, which may
/// be destroyed earlier. A default-constructed token is never cancelled. Thread-safe.
class SSOCLIENT_ACCESS_EXPORT CancellationToken {
 public:
  CancellationToken() noexcept = default;

  bool IsCancelled() const noexcept;
  /// False for a default-constructed token.
  bool CanBeCancelled() const noexcept { return state_ != nullptr; }
  /// Runs `action` once when the token is cancelled, on the thread that cancels it; immediately,
  /// in this call, when it already is. `action` must not throw or block. The registration must be
  /// kept for as long as `action` is to run. Throws `Tarnik::InvalidArgumentException` when
  /// `action` is empty.
  [[nodiscard]] CancellationRegistration OnCancel(std::function<void()> action) const;

 private:
  friend class CancellationSource;
  class State;
  explicit CancellationToken(std::shared_ptr<State> state) noexcept;
  std::shared_ptr<State> state_;
};

/// Cancels the calls that were made with its token. Thread-safe.
class SSOCLIENT_ACCESS_EXPORT CancellationSource {
 public:
  CancellationSource();

  CancellationToken Token() const noexcept { return token_; }
  /// Cancels the calls under way, which end with `Tarnik::CancelledException`, as do those made
  /// later. Runs the registered functions before it returns. May be called any number of times.
  void Cancel() const noexcept;

 private:
  CancellationToken token_;
};

/// How long one caller waits for one result. It applies to every stage of the call: waiting for
/// another caller's request, for the next attempt, for the connection, and for the answer.
struct CallContext {
  using Clock = std::chrono::steady_clock;

  /// The call ends at this time at the latest, with a `CommunicationException` that says what it
  /// was waiting for. The default is no limit of the caller's own; an exchange with the service
  /// still has its limit of 240 seconds.
  Clock::time_point deadline = Clock::time_point::max();
  /// Ends the call earlier, with `Tarnik::CancelledException`.
  CancellationToken cancellation;

  /// A context whose deadline is `duration` from now. A duration that is too long for the clock
  /// means no deadline.
  static CallContext Within(std::chrono::milliseconds duration) {
    CallContext context;
    const auto now = Clock::now();
    if (duration <
        std::chrono::duration_cast<std::chrono::milliseconds>(Clock::time_point::max() - now)) {
      context.deadline = now + duration;
    }
    return context;
  }
};

}  // namespace SsoClient::Access

#endif
