#ifndef TARNIK_SUPPORT_PROCESS_END_H
#define TARNIK_SUPPORT_PROCESS_END_H

#include <condition_variable>
#include <mutex>

namespace Tarnik {

/// True from the moment when process exit stops the thread pool. What needs the pool can no longer
/// end by itself.
bool HasProcessEndBegun() noexcept;

/// Makes `HasProcessEndBegun` true and wakes the threads that a `ProcessEndWatch` protects. Called
/// by the exit handler of the thread pool.
void BeginProcessEnd() noexcept;

/// Wakes a wait when the process ends. Constructed before the wait by the thread that waits,
/// without `mutex`; the condition that it waits for must include `HasProcessEndBegun()`. Allocates
/// nothing.
class ProcessEndWatch {
 public:
  ProcessEndWatch(std::mutex& mutex, std::condition_variable& signal) noexcept;
  ~ProcessEndWatch();
  ProcessEndWatch(const ProcessEndWatch&) = delete;
  ProcessEndWatch& operator=(const ProcessEndWatch&) = delete;

 private:
  friend void BeginProcessEnd() noexcept;

  void Wake() noexcept;

  std::mutex& mutex_;
  std::condition_variable& signal_;
  ProcessEndWatch* previous_ = nullptr;
  ProcessEndWatch* next_ = nullptr;
};

}  // namespace Tarnik

#endif
