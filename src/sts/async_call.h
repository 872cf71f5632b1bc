#ifndef SSOCLIENT_STS_ASYNC_CALL_H
#define SSOCLIENT_STS_ASYNC_CALL_H

#include <functional>
#include <memory>
#include <new>
#include <utility>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

namespace SsoClient {

/// Passes an argument to an asynchronous call by reference, where other arguments are copied. The
/// caller keeps the object alive until the callback has returned.
template <class T>
class PassByRefHelper {
 public:
  explicit PassByRefHelper(T& object) noexcept : object_(&object) {}
  T& Get() const noexcept { return *object_; }

 private:
  T* object_;
};

inline constexpr char kProcessIsEnding[] = "The operation was not started: the process is ending.";

/// The callback of an asynchronous call, which runs exactly once: if it has not run when this
/// object is destroyed, the process is ending and the call has not started.
template <class Result>
class AsyncReport {
 public:
  using Callback = std::function<void(const Result&, const Tarnik::Exception*)>;

  explicit AsyncReport(Callback callback) : callback_(std::move(callback)) {}
  ~AsyncReport() {
    if (callback_) {
      Fail(processIsEnding_);
    }
  }
  AsyncReport(const AsyncReport&) = delete;
  AsyncReport& operator=(const AsyncReport&) = delete;

  void Succeed(const Result& result) { Take()(result, nullptr); }
  void Fail(const Tarnik::Exception& failure) { Take()(Result{}, &failure); }
  /// Drops the callback of a call whose failure was thrown.
  void Drop() { Take(); }

 private:
  Callback Take() { return std::exchange(callback_, nullptr); }

  Callback callback_;
  const CommunicationException processIsEnding_{kProcessIsEnding};
};

/// Reports on an I/O thread that the call has no worker.
template <class Result>
void ReportLater(Tarnik::System::ThreadPool& pool,
                 const std::shared_ptr<AsyncReport<Result>>& report,
                 const Tarnik::ResourceException& failure) {
  try {
    pool.Post([report, failure] { report->Fail(failure); });
  } catch (...) {
    report->Drop();
    throw;
  }
}

/// Runs `operation` on a worker thread of the platform's pool and returns immediately. `callback`
/// then receives the result and null, or an empty result and the platform exception that the
/// operation threw, which is valid only during the call. It receives a `ResourceException` when
/// memory runs out during the operation and, on an I/O thread, when no worker can be started; and a
/// `CommunicationException` when the process ends before a worker is free. Exceptions of other
/// types, and those of the callback, propagate out of the work item.
///
/// Throws `Tarnik::InvalidArgumentException` when `callback` is empty, `CommunicationException`
/// when the process is ending, `Tarnik::ResourceException` when the pool has no thread at all, and
/// `std::bad_alloc`; the callback then never runs.
template <class Result>
void SyncToAsyncCall(std::function<Result()> operation,
                     std::function<void(const Result&, const Tarnik::Exception*)> callback) {
  if (!callback) {
    throw Tarnik::InvalidArgumentException("The callback must not be empty.");
  }
  if (Tarnik::System::IsProcessEnding()) {
    throw CommunicationException(kProcessIsEnding);
  }
  const auto report = std::make_shared<AsyncReport<Result>>(std::move(callback));
  const auto pool = Tarnik::System::GetThreadPool();
  try {
    pool->Run([operation = std::move(operation), report] {
      Result result{};
      try {
        result = operation();
      } catch (const Tarnik::Exception& failure) {
        report->Fail(failure);
        return;
      } catch (const std::bad_alloc&) {
        report->Fail(Tarnik::OutOfMemory());
        return;
      } catch (...) {
        report->Drop();
        throw;
      }
      report->Succeed(result);
    });
  } catch (const Tarnik::InvalidStateException&) {
    report->Drop();
    throw CommunicationException(kProcessIsEnding);
  } catch (const Tarnik::ResourceException& failure) {
    ReportLater(*pool, report, failure);
  } catch (...) {
    report->Drop();
    throw;
  }
}

}  // namespace SsoClient

#endif
