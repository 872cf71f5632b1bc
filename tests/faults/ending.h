#ifndef SSOCLIENT_TESTS_FAULTS_ENDING_H
#define SSOCLIENT_TESTS_FAULTS_ENDING_H

#include <atomic>
#include <cstddef>
#include <thread>

#include <tarnik/core/exception.h>

namespace SsoClient::Testing {

/// How an operation ended. Recording it and waiting for it need no memory.
class Ending {
 public:
  void Record(const Tarnik::Exception* error, std::size_t bytes = 0) {
    isIoFailure_ = dynamic_cast<const Tarnik::IOException*>(error) != nullptr;
    isCancelled_ = dynamic_cast<const Tarnik::CancelledException*>(error) != nullptr;
    bytes_ = bytes;
    hasError_ = error != nullptr;
    ++count_;
  }
  void Await() const {
    while (count_ == 0) {
      std::this_thread::yield();
    }
  }

  int Count() const { return count_; }
  bool IsSuccess() const { return !hasError_; }
  bool IsIoFailure() const { return isIoFailure_; }
  bool IsCancelled() const { return isCancelled_; }
  std::size_t Bytes() const { return bytes_; }

 private:
  bool hasError_ = false;
  bool isIoFailure_ = false;
  bool isCancelled_ = false;
  std::size_t bytes_ = 0;
  std::atomic<int> count_{0};
};

}  // namespace SsoClient::Testing

#endif
