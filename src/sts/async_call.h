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

/// Runs `operation` on a worker thread of the platform's pool and returns immediately. `callback`
/// then receives the result and null, or an empty result and the platform exception that the
/// operation threw, which is valid only during the call. It receives a `ResourceException` when
/// memory runs out during the operation and, on an I/O thread, when no worker can be started.
/// Exceptions of other types, and those of the callback, propagate out of the work item.
///
/// Throws `Tarnik::InvalidArgumentException` when `callback` is empty, `CommunicationException`
/// when the process is ending, and `Tarnik::ResourceException` when the pool has no thread at all;
/// the callback then never runs.
template <class Result>
void SyncToAsyncCall(std::function<Result()> operation,
                     std::function<void(const Result&, const Tarnik::Exception*)> callback) {
  if (!callback) {
    throw Tarnik::InvalidArgumentException("The callback must not be empty.");
  }
  if (Tarnik::System::IsProcessEnding()) {
    throw CommunicationException(kProcessIsEnding);
  }
  const auto report = std::make_shared<const decltype(callback)>(std::move(callback));
  const auto pool = Tarnik::System::GetThreadPool();
  try {
    pool->Run([operation = std::move(operation), report] {
      Result result{};
      try {
        result = operation();
      } catch (const Tarnik::Exception& error) {
        (*report)(Result{}, &error);
        return;
      } catch (const std::bad_alloc&) {
        (*report)(Result{}, &Tarnik::OutOfMemory());
        return;
      }
      (*report)(result, nullptr);
    });
  } catch (const Tarnik::InvalidStateException&) {
    throw CommunicationException(kProcessIsEnding);
  } catch (const Tarnik::ResourceException& error) {
    pool->Post([report, error] { (*report)(Result{}, &error); });
  }
}

}  // namespace SsoClient

#endif
