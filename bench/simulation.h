#ifndef BENCH_SIMULATION_H
#define BENCH_SIMULATION_H

#include <cstddef>
#include <cstdint>
#include <functional>
#include <memory>
#include <queue>
#include <vector>

#include "instant.h"
#include "runtime.h"

namespace Bench {

/// A generator with little state for each of many users (SplitMix64), for the distributions of the
/// standard library.
class Random {
 public:
  using result_type = std::uint64_t;

  explicit Random(std::uint64_t seed) : state_(seed) {}

  static constexpr result_type min() { return 0; }
  static constexpr result_type max() { return ~result_type{0}; }
  result_type operator()() noexcept {
    state_ += 0x9e3779b97f4a7c15U;
    result_type mixed = state_;
    mixed = (mixed ^ (mixed >> 30)) * 0xbf58476d1ce4e5b9U;
    mixed = (mixed ^ (mixed >> 27)) * 0x94d049bb133111ebU;
    return mixed ^ (mixed >> 31);
  }

 private:
  std::uint64_t state_;
};

/// Virtual time, in which many pieces of work run that may sleep, all on one thread of the system.
/// Time passes only while nothing is due.
class Simulation {
 public:
  using Instant = SsoClient::Access::Instant;
  using Time = Instant::Steady;
  using Timer = std::uint64_t;

  Simulation();
  ~Simulation();
  Simulation(const Simulation&) = delete;
  Simulation& operator=(const Simulation&) = delete;

  const Instant& Now() const noexcept { return now_; }
  /// Runs `action`, which must not sleep, at `time`.
  Timer At(Time time, std::function<void()> action);
  /// False when the action has begun or has been cancelled.
  bool Cancel(Timer timer);
  /// Runs `work`, which must not throw, now or soon.
  void Run(std::function<void()> work);
  /// Only in a piece of work.
  void Sleep(std::chrono::milliseconds duration);

  void PassUntil(Time end);
  /// Lets time pass until no piece of work sleeps.
  void Settle();

 private:
  struct Fiber;
  struct Scheduled {
    Time time;
    Timer timer;
    std::size_t slot;

    bool operator<(const Scheduled& other) const noexcept {
      return time != other.time ? time > other.time : timer > other.timer;
    }
  };
  struct Slot {
    Timer timer = 0;  ///< zero when it is free
    std::function<void()> action;
  };

  static void RunFiber();
  bool FireNext(Time end);
  void RunWork();
  void Resume(Fiber& fiber);

  Instant now_;
  Timer lastTimer_ = 0;
  std::priority_queue<Scheduled> schedule_;
  std::vector<Slot> slots_;
  std::vector<std::size_t> freeSlots_;
  std::queue<std::function<void()>> work_;
  std::vector<std::unique_ptr<Fiber>> fibers_;
  std::vector<Fiber*> idleFibers_;
  Fiber* current_ = nullptr;
  std::size_t sleeping_ = 0;
};

/// A runtime for one token source. `simulation` must outlive it. The random numbers follow from
/// `seed`. The source must not be stopped: to wait for others, it counts what runs on its thread,
/// which is everything here.
std::shared_ptr<SsoClient::Access::Runtime> CreateRuntime(Simulation& simulation,
                                                          std::uint64_t seed);

}  // namespace Bench

#endif
