#ifndef TARNIK_SYSTEM_POOL_THREAD_H
#define TARNIK_SYSTEM_POOL_THREAD_H

#include <functional>

#include "support/fork.h"

namespace Tarnik::System {

/// Starts a detached thread that debuggers show as `name` (at most 15 characters). The host
/// program's signal handlers never run on it: all signals are blocked except those that a thread
/// raises itself. Throws `ResourceException` when the system cannot create a thread.
void StartPoolThread(const char* name, std::function<void()> body);

/// Stops the calling thread until the process ends.
[[noreturn]] void ParkThread() noexcept;

/// Contains the code of a caller that runs on a thread of the pool. When that code forks, the child
/// ends instead of leaving the scope: what follows belongs to the threads of the parent.
class CompletionScope {
 public:
  CompletionScope() = default;
  ~CompletionScope();
  CompletionScope(const CompletionScope&) = delete;
  CompletionScope& operator=(const CompletionScope&) = delete;

 private:
  ForkMark mark_;
};

/// Runs `completion` in a `CompletionScope`.
void RunCompletion(const std::function<void()>& completion);

}  // namespace Tarnik::System

#endif
