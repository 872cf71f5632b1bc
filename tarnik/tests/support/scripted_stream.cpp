#include "support/scripted_stream.h"

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <memory>
#include <mutex>
#include <string>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/system/thread_pool.h>

namespace Tarnik::Testing {
namespace {

std::atomic<int> liveCount{0};

std::shared_ptr<Exception> Cancelled() {
  return std::make_shared<CancelledException>("The stream was closed.");
}

}  // namespace

ScriptedStream::ScriptedStream(Script script) : script_(std::move(script)) {
  ++liveCount;
}

ScriptedStream::~ScriptedStream() {
  --liveCount;
}

int ScriptedStream::LiveCount() noexcept {
  return liveCount;
}

void ScriptedStream::Push(const std::string& bytes) {
  const std::lock_guard guard(mutex_);
  input_ += bytes;
  Serve();
}

void ScriptedStream::PushEnd() {
  const std::lock_guard guard(mutex_);
  hasEnd_ = true;
  Serve();
}

void ScriptedStream::PushError(const std::string& message) {
  const std::lock_guard guard(mutex_);
  inputError_ = std::make_shared<IOException>(message);
  Serve();
}

std::string ScriptedStream::Written() const {
  const std::lock_guard guard(mutex_);
  return written_;
}

bool ScriptedStream::IsClosed() const {
  const std::lock_guard guard(mutex_);
  return isClosed_;
}

bool ScriptedStream::IsRead() const {
  const std::lock_guard guard(mutex_);
  return static_cast<bool>(read_.completion);
}

void ScriptedStream::ReleaseWrite() {
  const std::lock_guard guard(mutex_);
  CompleteWrite(std::exchange(heldWrite_, nullptr), nullptr, true);
}

void ScriptedStream::ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) {
  const std::lock_guard guard(mutex_);
  if (read_.completion) {
    throw InvalidStateException("A second read was started.");
  }
  read_ = {buffer, size, std::move(completion)};
  Serve();
}

void ScriptedStream::Serve() {
  if (!read_.completion) {
    return;
  }
  if (isClosed_) {
    CompleteRead(0, Cancelled());
    return;
  }
  if (!input_.empty()) {
    const std::size_t size = std::min({input_.size(), read_.size, script_.pieceSize});
    std::copy_n(input_.begin(), size, read_.buffer);
    input_.erase(0, size);
    CompleteRead(size, nullptr);
    return;
  }
  if (inputError_ != nullptr || hasEnd_) {
    CompleteRead(0, inputError_);
  }
}

void ScriptedStream::CompleteRead(std::size_t size, std::shared_ptr<Exception> error) {
  ReadCompletion completion = std::exchange(read_, {}).completion;
  System::GetThreadPool()->Post([self = Ref<ScriptedStream>(this),
                                 completion = std::move(completion), size,
                                 error] { completion(size, error.get()); });
}

void ScriptedStream::WriteAsync(const char* data, std::size_t size, WriteCompletion completion) {
  const std::lock_guard guard(mutex_);
  if (isClosed_) {
    CompleteWrite(std::move(completion), Cancelled(), false);
    return;
  }
  const std::size_t taken =
      std::min(size, script_.failWriteAt - std::min(script_.failWriteAt, written_.size()));
  written_.append(data, taken);
  if (taken < size) {
    CompleteWrite(std::move(completion), std::make_shared<IOException>("The write failed."), false);
    return;
  }
  if (script_.holdWrites) {
    heldWrite_ = std::move(completion);
    return;
  }
  CompleteWrite(std::move(completion), nullptr, true);
}

void ScriptedStream::CompleteWrite(WriteCompletion completion, std::shared_ptr<Exception> error,
                                   bool runsHook) {
  System::GetThreadPool()->Post(
      [self = Ref<ScriptedStream>(this), completion = std::move(completion), error, runsHook] {
        if (runsHook && self->script_.onWritten) {
          self->script_.onWritten(*self);
        }
        completion(error.get());
      });
}

void ScriptedStream::Close() noexcept {
  const std::lock_guard guard(mutex_);
  isClosed_ = true;
  Serve();
  if (heldWrite_) {
    CompleteWrite(std::exchange(heldWrite_, nullptr), Cancelled(), false);
  }
}

}  // namespace Tarnik::Testing
