#ifndef SSOCLIENT_ACCESS_TESTS_END_TO_END_GATE_H
#define SSOCLIENT_ACCESS_TESTS_END_TO_END_GATE_H

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <mutex>

namespace SsoClient::Access::Testing {

/// Holds the threads that pass, for example those of a dev STS, until it is opened.
class Gate {
 public:
  Gate() = default;
  Gate(const Gate&) = delete;
  Gate& operator=(const Gate&) = delete;

  void Pass() {
    std::unique_lock lock(mutex_);
    ++arrivals_;
    changed_.notify_all();
    changed_.wait(lock, [this] { return isOpen_; });
  }
  void Open() {
    const std::lock_guard lock(mutex_);
    isOpen_ = true;
    changed_.notify_all();
  }
  /// Waits until so many threads have arrived. Returns false if they do not within a minute.
  bool Await(std::size_t arrivals) const {
    std::unique_lock lock(mutex_);
    return changed_.wait_for(lock, std::chrono::minutes(1), [&] { return arrivals_ >= arrivals; });
  }

 private:
  mutable std::mutex mutex_;
  mutable std::condition_variable changed_;
  std::size_t arrivals_ = 0;
  bool isOpen_ = false;
};

}  // namespace SsoClient::Access::Testing

#endif
