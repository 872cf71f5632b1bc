#ifndef SSOCLIENT_STS_ASYNC_CALL_H
#define SSOCLIENT_STS_ASYNC_CALL_H

#include <functional>
#include <utility>

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

/// Runs `operation` on a worker thread of the platform's pool and returns immediately. `callback`
/// then receives the result and null, or an empty result and the platform exception that the
/// operation threw, which is valid only during the call. Exceptions of other types, and those of
/// the callback, propagate out of the work item.
///
/// Throws `Tarnik::InvalidArgumentException` when `callback` is empty.
template <class Result>
void SyncToAsyncCall(std::function<Result()> operation,
                     std::function<void(const Result&, const Tarnik::Exception*)> callback) {
  if (!callback) {
    throw Tarnik::InvalidArgumentException("The callback must not be empty.");
  }
  Tarnik::System::GetThreadPool()->Run(
      [operation = std::move(operation), callback = std::move(callback)] {
        Result result{};
        try {
          result = operation();
        } catch (const Tarnik::Exception& error) {
          callback(Result{}, &error);
          return;
        }
        callback(result, nullptr);
      });
}

}  // namespace SsoClient

#endif
