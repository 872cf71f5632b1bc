#ifndef TARNIK_TESTS_SUPPORT_FORKED_CHILD_H
#define TARNIK_TESTS_SUPPORT_FORKED_CHILD_H

#include <sys/types.h>

namespace Tarnik::Testing {

/// Waits until the other threads sleep, and runs `check` in a forked child, which ends with it.
/// Returns true when it returned true; false also when it threw or took longer than a minute.
template <class Check>
bool HoldsInChild(const Check& check);
/// The same while other threads run. They and `check` must not allocate (`AwaitIdleThreads`).
template <class Check>
bool HoldsInChildOfBusyThreads(const Check& check);

/// Waits for a child and returns true when it ended with status 0.
bool HasSucceeded(pid_t child);
/// Forks. The child is ended by a signal after a minute.
pid_t ForkWithLimit();
/// Waits until all other threads sleep, so that none is inside an allocation: the allocator of
/// AddressSanitizer remains locked in a child when another thread allocates during the fork.
void AwaitIdleThreads();
/// Ends a child without the exit handlers of the test program.
[[noreturn]] void EndChild(bool hasSucceeded);

template <class Check>
bool HoldsInChild(const Check& check) {
  AwaitIdleThreads();
  return HoldsInChildOfBusyThreads(check);
}

template <class Check>
bool HoldsInChildOfBusyThreads(const Check& check) {
  const pid_t child = ForkWithLimit();
  if (child != 0) {
    return HasSucceeded(child);
  }
  try {
    EndChild(check());
  } catch (...) {
    EndChild(false);
  }
}

}  // namespace Tarnik::Testing

#endif
