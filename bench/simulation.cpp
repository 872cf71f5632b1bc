#include "simulation.h"

#include <random>
#include <utility>

#include <ucontext.h>

namespace Bench {

namespace {

constexpr std::size_t kStackSize = 128UL * 1024;
constexpr std::size_t kSlotBits = 24;

// What runs now, for the first function of a new fiber, which has no parameters.
Simulation* running = nullptr;

}  // namespace

/// A stack on which a piece of work runs, and where it continues.
struct Simulation::Fiber {
  Fiber() {
    getcontext(&inside);
    inside.uc_stack.ss_sp = stack.get();
    inside.uc_stack.ss_size = kStackSize;
    makecontext(&inside, &Simulation::RunFiber, 0);
  }

  ucontext_t outside{};
  ucontext_t inside{};
  std::unique_ptr<char[]> stack{new char[kStackSize]};
  std::function<void()> work;
};

Simulation::Simulation()
    : now_{Time(std::chrono::hours(1000)), Instant::Wall(std::chrono::hours(24 * 365 * 60))} {}

Simulation::~Simulation() = default;

Simulation::Timer Simulation::At(Time time, std::function<void()> action) {
  std::size_t slot = slots_.size();
  if (freeSlots_.empty()) {
    slots_.emplace_back();
  } else {
    slot = freeSlots_.back();
    freeSlots_.pop_back();
  }
  const Timer timer = (++lastTimer_ << kSlotBits) | slot;
  slots_[slot] = {timer, std::move(action)};
  schedule_.push({time, timer, slot});
  return timer;
}

bool Simulation::Cancel(Timer timer) {
  Slot& slot = slots_[timer & ((1UL << kSlotBits) - 1)];
  if (slot.timer != timer || !slot.action) {
    return false;
  }
  slot.action = nullptr;  // the slot is freed at its time
  return true;
}

void Simulation::Run(std::function<void()> work) {
  work_.push(std::move(work));
}

void Simulation::Sleep(std::chrono::milliseconds duration) {
  Fiber* const fiber = current_;
  At(now_.steady + duration, [this, fiber] {
    --sleeping_;
    Resume(*fiber);
  });
  ++sleeping_;
  swapcontext(&fiber->inside, &fiber->outside);
}

void Simulation::PassUntil(Time end) {
  for (;;) {
    RunWork();
    if (!FireNext(end)) {
      break;
    }
  }
  now_.wall += end - now_.steady;
  now_.steady = end;
}

void Simulation::Settle() {
  RunWork();
  while (sleeping_ > 0 && FireNext(Time::max())) {
    RunWork();
  }
}

bool Simulation::FireNext(Time end) {
  if (schedule_.empty() || schedule_.top().time > end) {
    return false;
  }
  const Scheduled next = schedule_.top();
  schedule_.pop();
  const auto action = std::move(slots_[next.slot].action);
  slots_[next.slot] = {};
  freeSlots_.push_back(next.slot);
  if (next.time > now_.steady) {
    now_.wall += next.time - now_.steady;
    now_.steady = next.time;
  }
  if (action) {
    action();
  }
  return true;
}

void Simulation::RunWork() {
  while (!work_.empty()) {
    if (idleFibers_.empty()) {
      fibers_.push_back(std::make_unique<Fiber>());
      idleFibers_.push_back(fibers_.back().get());
    }
    Fiber& fiber = *idleFibers_.back();
    idleFibers_.pop_back();
    fiber.work = std::move(work_.front());
    work_.pop();
    Resume(fiber);
  }
}

void Simulation::Resume(Fiber& fiber) {
  current_ = &fiber;
  running = this;
  swapcontext(&fiber.outside, &fiber.inside);
  current_ = nullptr;
}

// Runs one piece of work after the other.
void Simulation::RunFiber() {
  for (;;) {
    Simulation& simulation = *running;
    Fiber& fiber = *simulation.current_;
    std::exchange(fiber.work, nullptr)();
    simulation.idleFibers_.push_back(&fiber);
    swapcontext(&fiber.inside, &fiber.outside);
  }
}

namespace {

class SimulatedRuntime final : public SsoClient::Access::Runtime {
 public:
  SimulatedRuntime(Simulation& simulation, std::uint64_t seed)
      : simulation_(simulation), random_(seed) {}

  Simulation::Instant Now() const override { return simulation_.Now(); }
  double Draw() override { return std::uniform_real_distribution<double>(0, 1)(random_); }
  void Run(std::function<void()> work) override { simulation_.Run(std::move(work)); }
  Tarnik::Ref<Tarnik::System::CancellableItem> RunAt(Simulation::Time time,
                                                     std::function<void()> action) override {
    const Simulation::Timer timer = simulation_.At(time, std::move(action));
    return Tarnik::System::CreateCancellableItem(
        [&simulation = simulation_, timer] { return simulation.Cancel(timer); });
  }

 private:
  Simulation& simulation_;
  Random random_;
};

}  // namespace

std::shared_ptr<SsoClient::Access::Runtime> CreateRuntime(Simulation& simulation,
                                                          std::uint64_t seed) {
  return std::make_shared<SimulatedRuntime>(simulation, seed);
}

}  // namespace Bench
