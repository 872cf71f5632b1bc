#include "support/scripted_spec.h"

#include <cstddef>
#include <mutex>
#include <string>
#include <utility>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/system/cancellable_item.h>
#include <tarnik/system/stream.h>
#include <tarnik/system/thread_pool.h>

#include "support/scripted_stream.h"

namespace Tarnik::Testing {
namespace {

/// Presents a stream as a TLS stream.
class PretendedTlsStream final : public Ssl::SSLStream, public ObjectImpl {
 public:
  explicit PretendedTlsStream(Ref<System::Stream> stream) : stream_(std::move(stream)) {}

  void HandshakeClientAsync(const std::string&, const std::string&, HandshakeCompletion) override {
    throw InvalidStateException("The handshake is over.");
  }
  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override {
    stream_->ReadAsync(buffer, size, std::move(completion));
  }
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override {
    stream_->WriteAsync(data, size, std::move(completion));
  }
  void Close() noexcept override { stream_->Close(); }

 private:
  ~PretendedTlsStream() override = default;

  const Ref<System::Stream> stream_;
};

}  // namespace

Ref<System::CancellableItem> ScriptedSpec::StartConnect(ConnectCompletion completion) {
  if (!script_.startError.empty()) {
    throw InvalidArgumentException(script_.startError);
  }
  {
    const std::lock_guard guard(mutex_);
    ++connectCount_;
  }
  if (script_.holdConnects) {
    const std::lock_guard guard(held_->mutex);
    held_->completion = std::move(completion);
  } else {
    System::GetThreadPool()->Post(
        [self = Ref<ScriptedSpec>(this), completion = std::move(completion)] {
          self->Complete(completion);
        });
  }
  if (script_.beforeStartReturns) {
    script_.beforeStartReturns();
  }
  return System::CreateCancellableItem([held = held_] {
    const std::lock_guard guard(held->mutex);
    ++held->cancelCount;
    if (auto heldCompletion = std::exchange(held->completion, nullptr)) {
      System::GetThreadPool()->Post([heldCompletion = std::move(heldCompletion)] {
        CancelledException cancelled("The connect was cancelled.");
        heldCompletion(nullptr, &cancelled);
      });
    }
    return true;
  });
}

void ScriptedSpec::Complete(const ConnectCompletion& completion) {
  if (!script_.connectError.empty()) {
    IOException error(script_.connectError);
    // Like a TLS handshake that has failed, which still passes its stream.
    completion(MakeRef<ScriptedStream>(script_.stream).get(), &error);
    return;
  }
  if (script_.omitsStream) {
    completion(nullptr, nullptr);
    return;
  }
  const auto stream = MakeRef<ScriptedStream>(script_.stream);
  {
    const std::lock_guard guard(mutex_);
    streams_.push_back(stream);
  }
  Ref<System::Stream> presented = stream;
  if (script_.isTls) {
    presented = MakeRef<PretendedTlsStream>(stream);
  }
  completion(presented.get(), nullptr);
}

void ScriptedSpec::ReleaseConnect() {
  ConnectCompletion completion;
  {
    const std::lock_guard guard(held_->mutex);
    completion = std::exchange(held_->completion, nullptr);
  }
  System::GetThreadPool()->Post(
      [self = Ref<ScriptedSpec>(this), completion = std::move(completion)] {
        self->Complete(completion);
      });
}

std::vector<Ref<ScriptedStream>> ScriptedSpec::Streams() const {
  const std::lock_guard guard(mutex_);
  return streams_;
}

std::size_t ScriptedSpec::ConnectCount() const {
  const std::lock_guard guard(mutex_);
  return connectCount_;
}

std::size_t ScriptedSpec::CancelCount() const {
  const std::lock_guard guard(held_->mutex);
  return held_->cancelCount;
}

void ScriptedSpec::ForgetStreams() {
  const std::lock_guard guard(mutex_);
  streams_.clear();
}

ScriptedStream::WriteHook AnswerWith(std::string answer) {
  return [answer = std::move(answer)](ScriptedStream& stream) { stream.Push(answer); };
}

}  // namespace Tarnik::Testing
