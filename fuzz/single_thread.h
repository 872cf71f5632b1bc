#ifndef FUZZ_SINGLE_THREAD_H
#define FUZZ_SINGLE_THREAD_H

#include <functional>

namespace Fuzz {

/// The libraries' pool has no I/O threads from now on, so that the order of its completions depends
/// only on the input. Called before the pool is first used.
void RunOnOneThread();

/// Runs the completions that are due, with those that they post. True if there were any.
bool RunCompletions();

/// Runs `wait` on another thread and, until it returns, the completions that are due for both.
void RunCompletionsDuring(const std::function<void()>& wait);

}  // namespace Fuzz

#endif
