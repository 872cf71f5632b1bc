#include "ssl/ssl_stream.h"

#include <array>
#include <memory>
#include <mutex>
#include <optional>
#include <utility>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/ssl/ssl_exception.h>
#include <tarnik/system/thread_pool.h>

#include "core/copy_exception.h"
#include "ssl/tls_engine.h"
#include "system/host_name.h"

namespace Tarnik::Ssl {
namespace {

constexpr std::size_t kInputSize = 16384 + 512;
// While at least this many bytes wait to be sent, no data is taken from a writer and no input is
// processed, since both may produce more output.
constexpr std::size_t kMaxOutput = 65536;

using System::GetThreadPool;

// Operations are recorded under the mutex, and `Advance` continues all of them as far as possible.
// It runs only on the pool's I/O threads, after each operation that was started and each operation
// of the stream below that ended. The mutex is not held when the stream below is used or
// completions run.
class SSLStreamImpl final : public SSLStream, public ObjectImpl {
 public:
  SSLStreamImpl(SSLContextImpl* context, System::Stream* stream, std::string name)
      : context_(context), below_(stream), name_(std::move(name)) {}

  void HandshakeClientAsync(const std::string& host, const std::string& serverName,
                            HandshakeCompletion completion) override;
  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override;
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override;
  void Close() noexcept override;
  std::string ToString() const override { return "<SSLStream:" + name_ + ">"; }

 private:
  using Self = Ref<SSLStreamImpl>;
  using Error = std::shared_ptr<Exception>;

  struct PendingRead {
    char* buffer;
    std::size_t size;
    ReadCompletion completion;
  };
  struct PendingWrite {
    const char* data;
    std::size_t size;
    WriteCompletion completion;
  };
  /// What `Advance` does after it has released the mutex.
  struct Steps {
    std::vector<std::function<void()>> completions;
    bool read = false;
    bool write = false;
    bool close = false;
  };

  void AdvanceSoon();
  void Advance();
  void AdvanceEngine(Steps& steps);
  bool AdvanceHandshake(Steps& steps);
  bool AdvanceRead(Steps& steps);
  void AdvanceWrite(Steps& steps);
  void FailPending(const Error& error, Steps& steps);
  void RequireInput() const;
  Error ToFailure(const Exception& error) const;
  void ReadBelow();
  void WriteBelow();
  void OnReadBelow(std::size_t bytesRead, const Exception* error);
  void OnWrittenBelow(const Exception* error);
  void RequireOpen(bool busy, const char* operation) const;

  const Ref<SSLContextImpl> context_;
  const Ref<System::Stream> below_;
  const std::string name_;

  std::mutex mutex_;
  std::unique_ptr<TlsEngine> engine_;
  bool closed_ = false;
  Error failure_;       // ends every operation from now on
  Error inputFailure_;  // ends operations that need more input than has arrived
  bool inputEnded_ = false;

  HandshakeCompletion handshake_;
  std::optional<PendingRead> read_;
  std::optional<PendingWrite> write_;

  // Used by the stream below while `readingBelow_` or `writingBelow_` is set, else under the mutex.
  std::array<char, kInputSize> input_;
  std::vector<char> output_;
  bool readingBelow_ = false;
  bool writingBelow_ = false;
};

void SSLStreamImpl::HandshakeClientAsync(const std::string& host, const std::string& serverName,
                                         HandshakeCompletion completion) {
  if (!completion) {
    throw InvalidArgumentException("The TLS handshake was given an empty completion.");
  }
  System::RequireHostName(host);
  if (!serverName.empty()) {
    System::RequireHostName(serverName);
  }
  {
    const std::lock_guard lock(mutex_);
    if (engine_ != nullptr) {
      throw InvalidStateException("The TLS handshake was started before.");
    }
    engine_ = std::make_unique<TlsEngine>(context_, host, serverName);
    handshake_ = std::move(completion);
    if (closed_) {
      failure_ =
          std::make_shared<CancelledException>("The TLS connection was closed on this side.");
    }
  }
  AdvanceSoon();
}

void SSLStreamImpl::RequireOpen(bool busy, const char* operation) const {
  if (engine_ == nullptr || handshake_) {
    throw InvalidStateException("The TLS handshake has not ended.");
  }
  if (busy) {
    throw InvalidStateException(std::string("A ") + operation + " is under way already.");
  }
}

void SSLStreamImpl::ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) {
  if (size == 0) {
    throw InvalidArgumentException("A read needs room for at least one byte.");
  }
  {
    const std::lock_guard lock(mutex_);
    RequireOpen(read_.has_value(), "read");
    read_ = PendingRead{buffer, size, std::move(completion)};
  }
  AdvanceSoon();
}

void SSLStreamImpl::WriteAsync(const char* data, std::size_t size, WriteCompletion completion) {
  {
    const std::lock_guard lock(mutex_);
    RequireOpen(write_.has_value(), "write");
    write_ = PendingWrite{data, size, std::move(completion)};
  }
  AdvanceSoon();
}

void SSLStreamImpl::Close() noexcept {
  {
    const std::lock_guard lock(mutex_);
    if (closed_) {
      return;
    }
    closed_ = true;
    failure_ = std::make_shared<CancelledException>("The TLS connection was closed on this side.");
  }
  below_->Close();
  AdvanceSoon();
}

void SSLStreamImpl::AdvanceSoon() {
  GetThreadPool()->Post([self = Self(this)] { self->Advance(); });
}

void SSLStreamImpl::Advance() {
  Steps steps;
  {
    const std::lock_guard lock(mutex_);
    if (engine_ == nullptr) {
      return;
    }
    try {
      AdvanceEngine(steps);
    } catch (const Exception& error) {
      failure_ = CopyException(error);
    }
    if (failure_ != nullptr) {
      FailPending(failure_, steps);
      steps.read = false;
    }
    // Also after a failure, since the output may be an alert for the peer.
    if (!closed_ && !writingBelow_ && engine_->OutputSize() > 0) {
      output_ = engine_->TakeOutput();
      steps.write = writingBelow_ = true;
    }
    steps.read = steps.read && !readingBelow_;
    readingBelow_ = readingBelow_ || steps.read;
    // A failed connection is closed, since its pending read would otherwise keep it alive until
    // somebody closes it.
    steps.close = failure_ != nullptr && !writingBelow_;
  }
  if (steps.write) {
    WriteBelow();
  }
  if (steps.read) {
    ReadBelow();
  }
  if (steps.close) {
    below_->Close();
  }
  for (const auto& completion : steps.completions) {
    completion();
  }
}

void SSLStreamImpl::AdvanceEngine(Steps& steps) {
  if (failure_ != nullptr) {
    return;
  }
  const bool needsInput = handshake_ ? AdvanceHandshake(steps) : AdvanceRead(steps);
  AdvanceWrite(steps);
  if (needsInput) {
    RequireInput();
    steps.read = true;
  }
}

// Like `AdvanceRead`, returns true when it needs more input.
bool SSLStreamImpl::AdvanceHandshake(Steps& steps) {
  if (!engine_->Handshake()) {
    return true;
  }
  steps.completions.push_back(
      [completion = std::exchange(handshake_, nullptr)] { completion(nullptr); });
  return false;
}

bool SSLStreamImpl::AdvanceRead(Steps& steps) {
  if (!read_ || engine_->OutputSize() >= kMaxOutput) {
    return false;
  }
  const auto bytesRead = engine_->Read(read_->buffer, read_->size);
  if (!bytesRead) {
    return true;
  }
  steps.completions.push_back([completion = std::move(read_->completion), size = *bytesRead] {
    completion(size, nullptr);
  });
  read_.reset();
  return false;
}

void SSLStreamImpl::AdvanceWrite(Steps& steps) {
  if (!write_) {
    return;
  }
  while (write_->size > 0 && engine_->OutputSize() < kMaxOutput) {
    const std::size_t taken = engine_->Write(write_->data, write_->size);
    write_->data += taken;
    write_->size -= taken;
  }
  if (write_->size > 0 || writingBelow_ || engine_->OutputSize() > 0) {
    return;
  }
  steps.completions.push_back(
      [completion = std::move(write_->completion)] { completion(nullptr); });
  write_.reset();
}

void SSLStreamImpl::RequireInput() const {
  if (inputFailure_ != nullptr) {
    inputFailure_->Throw();
  }
  if (inputEnded_) {
    engine_->FailAtEndOfInput();
  }
}

// During the handshake a failure of the stream below becomes a handshake failure, which names the
// peer.
SSLStreamImpl::Error SSLStreamImpl::ToFailure(const Exception& error) const {
  if (!handshake_ || dynamic_cast<const CancelledException*>(&error) != nullptr) {
    return CopyException(error);
  }
  return std::make_shared<SSLException>(engine_->HandshakeError(error.Message()));
}

void SSLStreamImpl::FailPending(const Error& error, Steps& steps) {
  if (handshake_) {
    steps.completions.push_back(
        [completion = std::exchange(handshake_, nullptr), error] { completion(error.get()); });
  }
  if (read_) {
    steps.completions.push_back(
        [completion = std::move(read_->completion), error] { completion(0, error.get()); });
    read_.reset();
  }
  if (write_) {
    steps.completions.push_back(
        [completion = std::move(write_->completion), error] { completion(error.get()); });
    write_.reset();
  }
}

void SSLStreamImpl::ReadBelow() {
  try {
    below_->ReadAsync(input_.data(), input_.size(),
                      [self = Self(this)](std::size_t bytesRead, Exception* error) {
                        self->OnReadBelow(bytesRead, error);
                      });
  } catch (const Exception& error) {
    OnReadBelow(0, &error);
  }
}

void SSLStreamImpl::OnReadBelow(std::size_t bytesRead, const Exception* error) {
  {
    const std::lock_guard lock(mutex_);
    readingBelow_ = false;
    if (error != nullptr) {
      inputFailure_ = ToFailure(*error);
    } else if (bytesRead == 0) {
      inputEnded_ = true;
    } else if (failure_ == nullptr) {
      try {
        engine_->Feed(input_.data(), bytesRead);
      } catch (const Exception& failed) {
        failure_ = CopyException(failed);
      }
    }
  }
  Advance();
}

void SSLStreamImpl::WriteBelow() {
  try {
    below_->WriteAsync(output_.data(), output_.size(),
                       [self = Self(this)](Exception* error) { self->OnWrittenBelow(error); });
  } catch (const Exception& error) {
    OnWrittenBelow(&error);
  }
}

void SSLStreamImpl::OnWrittenBelow(const Exception* error) {
  {
    const std::lock_guard lock(mutex_);
    writingBelow_ = false;
    if (error != nullptr && failure_ == nullptr) {
      failure_ = ToFailure(*error);
    }
  }
  Advance();
}

}  // namespace

Ref<SSLStream> CreateSSLStream(SSLContextImpl* context, System::Stream* stream,
                               const std::string& name) {
  return MakeRef<SSLStreamImpl>(context, stream, name);
}

}  // namespace Tarnik::Ssl
