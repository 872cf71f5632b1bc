#ifndef SSOCLIENT_ACCESS_CALL_CONTEXT_H
#define SSOCLIENT_ACCESS_CALL_CONTEXT_H

#include <chrono>
#include <cstdint>
#include <functional>
#include <memory>

#include <ssoclient/access/export.h>

namespace SsoClient::Access {

class CancellationState;

/// Keeps a function registered with a `CancellationToken`. Its destructor removes the function; if
/// the function is running on another thread, the destructor waits until it has returned, so the
/// caller must not hold a lock that the function needs.
class SSOCLIENT_ACCESS_EXPORT CancellationRegistration {
 public:
  CancellationRegistration() noexcept = default;
  /// Takes over the registration; `other` then has none.
  CancellationRegistration(CancellationRegistration&& other) noexcept;
  /// Removes the function of this registration, as the destructor does, and takes over that of
  /// `other`.
  CancellationRegistration& operator=(CancellationRegistration&& other) noexcept;
  ~CancellationRegistration();

 private:
  friend class CancellationToken;
  CancellationRegistration(std::shared_ptr<CancellationState> state, std::uint64_t id) noexcept;

  std::shared_ptr<CancellationState> state_;
  std::uint64_t id_ = 0;
};

/// Reports that the caller has given up. A copy refers to the same `CancellationSource`, which may
/// be destroyed earlier. A default-constructed token is never cancelled. Thread-safe.
class SSOCLIENT_ACCESS_EXPORT CancellationToken {
 public:
  CancellationToken() noexcept = default;

  /// True after the first call of `CancellationSource::Cancel`. Always false for a
  /// default-constructed token.
  bool IsCancelled() const noexcept;
  /// False for a default-constructed token.
  bool CanBeCancelled() const noexcept { return state_ != nullptr; }
  /// Runs `action` once when the token is cancelled, on the thread that cancels it, or in this call
  /// if it already is; never after the registration has been destroyed. `action` must not throw or
  /// block. Throws `Tarnik::InvalidArgumentException` when `action` is empty.
  [[nodiscard]] CancellationRegistration OnCancel(std::function<void()> action) const;

 private:
  friend class CancellationSource;
  explicit CancellationToken(std::shared_ptr<CancellationState> state) noexcept;

  std::shared_ptr<CancellationState> state_;
};

/// Cancels the calls that were made with its token. Copies share one state. Thread-safe.
///
/// In a forked child, it cancels what the child has begun: functions that its parent has
/// registered, and calls of the parent, are left to the parent.
class SSOCLIENT_ACCESS_EXPORT CancellationSource {
 public:
  CancellationSource();

  /// The token to pass to calls, by `CallContext::cancellation`; any number of them may have it.
  CancellationToken Token() const noexcept { return token_; }
  /// Ends the calls under way with `Tarnik::CancelledException`, and those that are made later. The
  /// registered functions have run when the first call of `Cancel` returns. May be called any
  /// number of times. What it runs, a callback too, may destroy this object.
  void Cancel() const noexcept;

 private:
  CancellationToken token_;
};

/// How long one caller waits for one result. It applies to every stage of the call: waiting for
/// another caller's request, for the next attempt, for the connection, and for the answer.
struct CallContext {
  /// The clock of deadlines. Changes of the system time do not affect it.
  using Clock = std::chrono::steady_clock;

  /// When the call ends at the latest, with a `CommunicationException` that says what it was
  /// waiting for. A call without a deadline of its own ends when its attempts have failed
  /// (`RetryConfig`).
  Clock::time_point deadline = Clock::time_point::max();
  /// Ends the call earlier, with `Tarnik::CancelledException`.
  CancellationToken cancellation{};
  /// The token must be valid for at least this long; zero means the source's own margin
  /// (`RefreshConfig::longestMargin`). Not negative.
  std::chrono::seconds minimumLife{0};

  /// A context whose deadline is `duration` from now. Negative durations, and what is not a number,
  /// count as zero, and those that are too long for the clock as no deadline.
  template <class Rep, class Period>
  static CallContext Within(std::chrono::duration<Rep, Period> duration) {
    using Seconds = std::chrono::duration<double>;
    const auto now = Clock::now();
    CallContext context;
    if (!(Seconds(duration) > Seconds::zero())) {
      context.deadline = now;
    } else if (Seconds(duration) < Seconds(Clock::time_point::max() - now) / 2) {
      context.deadline = now + std::chrono::duration_cast<Clock::duration>(duration);
    }
    return context;
  }
};

}  // namespace SsoClient::Access

#endif
