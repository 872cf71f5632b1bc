#include "support/threaded_runtime.h"

#include <utility>

namespace SsoClient::Access::Testing {

ThreadedRuntime::ThreadedRuntime(int workers) {
  for (int i = 0; i < workers; ++i) {
    threads_.emplace_back([queues = queues_] { Work(*queues); });
  }
  threads_.emplace_back([queues = queues_] { FireTimers(*queues); });
}

ThreadedRuntime::~ThreadedRuntime() {
  {
    const std::lock_guard lock(queues_->mutex);
    queues_->isEnding = true;
    queues_->changed.notify_all();
  }
  for (std::thread& thread : threads_) {
    // The last reference may be released by a worker.
    if (thread.get_id() == std::this_thread::get_id()) {
      thread.detach();
    } else {
      thread.join();
    }
  }
}

double ThreadedRuntime::Draw() {
  const std::lock_guard lock(randomMutex_);
  return std::uniform_real_distribution<double>(0, 1)(random_);
}

void ThreadedRuntime::Run(std::function<void()> work) {
  const std::lock_guard lock(queues_->mutex);
  queues_->work.push_back(std::move(work));
  queues_->changed.notify_all();
}

Tarnik::Ref<Tarnik::System::CancellableItem> ThreadedRuntime::RunAt(Instant::Steady time,
                                                                    std::function<void()> action) {
  const std::lock_guard lock(queues_->mutex);
  const TimerKey key{time, ++queues_->lastTimer};
  queues_->timers.emplace(key, std::move(action));
  queues_->changed.notify_all();
  return Tarnik::System::CreateCancellableItem([queues = queues_, key] {
    std::map<TimerKey, std::function<void()>>::node_type removed;
    const std::lock_guard guard(queues->mutex);
    removed = queues->timers.extract(key);
    return !removed.empty();
  });
}

void ThreadedRuntime::Work(Queues& queues) {
  std::unique_lock lock(queues.mutex);
  while (true) {
    queues.changed.wait(lock, [&] { return queues.isEnding || !queues.work.empty(); });
    if (queues.work.empty()) {
      return;
    }
    auto work = std::move(queues.work.front());
    queues.work.pop_front();
    lock.unlock();
    work();
    work = nullptr;
    lock.lock();
  }
}

void ThreadedRuntime::FireTimers(Queues& queues) {
  std::unique_lock lock(queues.mutex);
  while (!queues.isEnding) {
    if (queues.timers.empty()) {
      queues.changed.wait(lock);
      continue;
    }
    const Instant::Steady first = queues.timers.begin()->first.first;
    if (first > std::chrono::steady_clock::now()) {
      queues.changed.wait_until(lock, first);
      continue;
    }
    auto timer = queues.timers.extract(queues.timers.begin());
    lock.unlock();
    timer.mapped()();
    timer = {};
    lock.lock();
  }
}

}  // namespace SsoClient::Access::Testing
