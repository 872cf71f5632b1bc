#ifndef SSOCLIENT_STS_SYNC_TO_ASYNC_CALL_H
#define SSOCLIENT_STS_SYNC_TO_ASYNC_CALL_H

#include <functional>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

namespace SsoClient {

/// Runs `operation` on a worker thread of the platform's pool and returns at once. `callback` then
/// gets the result and null, or an empty result and the platform exception that the operation
/// threw, valid only during the call. Exceptions of other types, and those of the callback, leave
/// the work item.
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
