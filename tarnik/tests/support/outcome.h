#ifndef TARNIK_TESTS_SUPPORT_OUTCOME_H
#define TARNIK_TESTS_SUPPORT_OUTCOME_H

#include <chrono>
#include <condition_variable>
#include <cstddef>
#include <memory>
#include <mutex>
#include <string>
#include <thread>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/stream.h>

namespace Tarnik::Testing {

constexpr std::chrono::seconds kPatience{30};

/// Records what a completion reports, and on which thread. The state is shared with the
/// completions, so that a completion that runs too often or too late is detected and does not crash
/// the test.
class Outcome {
 public:
  Outcome() : state_(std::make_shared<State>()) {}

  void Report(const Exception* error, std::size_t bytes = 0) const {
    const std::lock_guard lock(state_->mutex);
    ++state_->count;
    state_->thread = std::this_thread::get_id();
    state_->bytes = bytes;
    if (error != nullptr) {
      state_->error = error->Clone();
    }
    state_->reported.notify_all();
  }

  System::Stream::WriteCompletion ForWrite() const {
    return [self = *this](Exception* error) { self.Report(error); };
  }
  System::Stream::ReadCompletion ForRead() const {
    return [self = *this](std::size_t bytes, Exception* error) { self.Report(error, bytes); };
  }

  /// Returns false if nothing is reported in time.
  [[nodiscard]] bool Wait(std::chrono::milliseconds limit = kPatience) const {
    std::unique_lock lock(state_->mutex);
    return state_->reported.wait_for(lock, limit, [this] { return state_->count > 0; });
  }

  int Count() const {
    const std::lock_guard lock(state_->mutex);
    return state_->count;
  }
  std::thread::id Thread() const {
    const std::lock_guard lock(state_->mutex);
    return state_->thread;
  }
  std::size_t Bytes() const {
    const std::lock_guard lock(state_->mutex);
    return state_->bytes;
  }
  /// The error's message; empty for success.
  std::string Message() const {
    const std::lock_guard lock(state_->mutex);
    return state_->error == nullptr ? "" : state_->error->Message();
  }
  template <class T>
  bool IsError() const {
    const std::lock_guard lock(state_->mutex);
    return dynamic_cast<const T*>(state_->error.get()) != nullptr;
  }

 private:
  struct State {
    std::mutex mutex;
    std::condition_variable reported;
    int count = 0;
    std::thread::id thread;
    std::size_t bytes = 0;
    std::unique_ptr<Throwable> error;
  };

  std::shared_ptr<State> state_;
};

/// Reads until the end of the stream, an error, or `limit` bytes.
inline std::string ReadAll(System::Stream& stream, std::size_t limit, std::string* error,
                           std::size_t pieceSize = 16384) {
  std::string all;
  std::string piece(pieceSize, '\0');
  while (all.size() < limit) {
    const Outcome outcome;
    stream.ReadAsync(piece.data(), piece.size(), outcome.ForRead());
    if (!outcome.Wait()) {
      *error = "no completion";
      return all;
    }
    *error = outcome.Message();
    if (!error->empty() || outcome.Bytes() == 0) {
      return all;
    }
    all.append(piece, 0, outcome.Bytes());
  }
  return all;
}

/// The error's message; empty for success.
inline std::string WriteAll(System::Stream& stream, const std::string& data) {
  const Outcome outcome;
  stream.WriteAsync(data.data(), data.size(), outcome.ForWrite());
  return outcome.Wait() ? outcome.Message() : "no completion";
}

}  // namespace Tarnik::Testing

#endif
