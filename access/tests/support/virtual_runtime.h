#ifndef SSOCLIENT_ACCESS_TESTS_SUPPORT_VIRTUAL_RUNTIME_H
#define SSOCLIENT_ACCESS_TESTS_SUPPORT_VIRTUAL_RUNTIME_H

#include <condition_variable>
#include <cstddef>
#include <deque>
#include <functional>
#include <map>
#include <memory>
#include <mutex>

#include "runtime.h"

namespace SsoClient::Access::Testing {

/// Time that passes only when the test says so, and work that runs on the test's thread. Timers
/// fire in order, each at its time.
class VirtualRuntime final : public Runtime {
 public:
  VirtualRuntime();
  ~VirtualRuntime() override;

  Instant Now() const override;
  double Draw() override;
  void Run(std::function<void()> work) override;
  Tarnik::Ref<Tarnik::System::CancellableItem> RunAt(Instant::Steady time,
                                                     std::function<void()> action) override;

  /// Runs what is due: timers and work, and what follows from them.
  void Settle();
  /// Lets time pass, with all that is due in it.
  void Advance(std::chrono::milliseconds duration);
  /// Lets time pass within an attempt: timers fire, but no other work runs.
  void Pass(std::chrono::milliseconds duration);
  /// As if the system was suspended, or its clock was set.
  void MoveWallClock(std::chrono::milliseconds duration);
  /// Runs work of other threads until `isDone`, which is checked after each piece of work.
  void RunUntil(const std::function<bool()>& isDone);

  void SetDraw(std::function<double()> draw);
  /// From now on, `Run` throws a `Tarnik::ResourceException`.
  void RefuseWork(bool isRefused);
  /// As at the end of the process: what is queued is destroyed without having run.
  void DropWork();
  std::size_t TimersArmed() const;
  std::size_t WorkQueued() const;

 private:
  class Timers;

  bool FireNext(Instant::Steady until);
  bool RunNext();
  void PassUntil(Instant::Steady until, bool runsWork);

  mutable std::mutex mutex_;
  std::condition_variable hasWork_;
  Instant now_;
  std::deque<std::function<void()>> work_;
  std::shared_ptr<Timers> timers_;
  std::function<double()> draw_;
  bool refusesWork_ = false;
};

}  // namespace SsoClient::Access::Testing

#endif
