#ifndef SSOCLIENT_ACCESS_TESTS_SUPPORT_THREADED_RUNTIME_H
#define SSOCLIENT_ACCESS_TESTS_SUPPORT_THREADED_RUNTIME_H

#include <condition_variable>
#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <mutex>
#include <random>
#include <thread>
#include <vector>

#include "runtime.h"

namespace SsoClient::Access::Testing {

/// The clocks of the system, a few worker threads, and a thread for timers.
class ThreadedRuntime final : public Runtime {
 public:
  explicit ThreadedRuntime(int workers);
  /// Runs the work that is queued, and drops the timers.
  ~ThreadedRuntime() override;

  Instant Now() const override { return Instant::Now(); }
  double Draw() override;
  void Run(std::function<void()> work) override;
  Tarnik::Ref<Tarnik::System::CancellableItem> RunAt(Instant::Steady time,
                                                     std::function<void()> action) override;

 private:
  using TimerKey = std::pair<Instant::Steady, std::uint64_t>;
  struct Queues {
    std::mutex mutex;
    std::condition_variable changed;
    std::deque<std::function<void()>> work;
    std::map<TimerKey, std::function<void()>> timers;
    std::uint64_t lastTimer = 0;
    bool isEnding = false;
  };

  static void Work(Queues& queues);
  static void FireTimers(Queues& queues);

  const std::shared_ptr<Queues> queues_ = std::make_shared<Queues>();
  std::mutex randomMutex_;
  std::mt19937 random_{11};
  std::vector<std::thread> threads_;
};

}  // namespace SsoClient::Access::Testing

#endif
