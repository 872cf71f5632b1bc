#include "ssl/ssl_stream.h"

#include <array>
#include <memory>
#include <mutex>
#include <new>
#include <optional>
#include <utility>
#include <vector>

#include <tarnik/core/object_impl.h>
#include <tarnik/ssl/ssl_exception.h>

#include "core/copy_exception.h"
#include "ssl/tls_engine.h"
#include "support/fork.h"
#include "system/connect_stage.h"
#include "system/handler_memory.h"
#include "system/host_name.h"
#include "system/post_with.h"

namespace Tarnik::Ssl {
namespace {

constexpr std::size_t kInputSize = 16384 + 512;
// While at least this many bytes wait to be sent, no data is taken from a writer and no input is
// processed, since both may produce more output.
constexpr std::size_t kMaxOutput = 65536;

// Operations are recorded under the mutex, and `Advance` continues all of them as far as possible.
// It runs only on the pool's I/O threads, after each operation that was started and each operation
// of the stream below that ended. The mutex is not held when the stream below is used or
// completions run.
//
// An allocation that fails on an I/O thread fails the connection: ending its operations needs no
// memory.
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
    Error error;
  };
  struct PendingWrite {
    const char* data;
    std::size_t size;
    WriteCompletion completion;
    Error error;
  };
  /// What `Advance` does after it has released the mutex.
  struct Steps {
    HandshakeCompletion endedHandshake;
    Error handshakeError;
    std::optional<PendingRead> endedRead;  // its size is the number of bytes that were read
    std::optional<PendingWrite> endedWrite;
    bool read = false;
    bool write = false;
    bool close = false;
  };

  std::string DescribePeer(const std::string& host) const;
  void RequireOwnProcess() const;
  void AdvanceSoon();
  void AdvanceNow();
  void Advance();
  Steps PrepareSteps();
  void AdvanceEngine(Steps& steps);
  void TakeOutput(Steps& steps);
  static void Complete(const Steps& steps);
  bool AdvanceHandshake(Steps& steps);
  bool AdvanceRead(Steps& steps);
  void AdvanceWrite(Steps& steps);
  void FailPending(Steps& steps);
  void RequireInput() const;
  Error ToFailure(const Exception& error) const noexcept;
  void ReadBelow();
  void WriteBelow();
  void OnReadBelow(std::size_t bytesRead, const Exception* error);
  void OnWrittenBelow(const Exception* error);
  void RequireOpen(bool busy, const char* operation) const;

  const Ref<SSLContextImpl> context_;
  const Ref<System::Stream> below_;
  const std::string name_;

  const ForkMark mark_;
  // The failure of operations after `Close`, which may not allocate.
  const Error closedFailure_ =
      CopyException(CancelledException("The TLS connection was closed on this side."));

  std::mutex mutex_;
  std::unique_ptr<TlsEngine> engine_;
  bool isClosed_ = false;
  bool isAdvancePosted_ = false;
  System::HandlerMemory advanceMemory_;
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
  RequireOwnProcess();
  System::RequireHostName(host);
  if (!serverName.empty()) {
    System::RequireHostName(serverName);
  }
  {
    const std::lock_guard lock(mutex_);
    if (engine_ != nullptr) {
      throw InvalidStateException("The TLS handshake was started before.");
    }
    engine_ = std::make_unique<TlsEngine>(context_, host, serverName, DescribePeer(host));
    handshake_ = std::move(completion);
    if (isClosed_) {
      failure_ = closedFailure_;
    }
  }
  AdvanceSoon();
}

// For messages: with the port if the stream below knows it.
std::string SSLStreamImpl::DescribePeer(const std::string& host) const {
  const auto* socket = dynamic_cast<const System::ConnectProgress*>(below_.get());
  return socket == nullptr ? host : System::DescribeEndpoint(host, socket->Port());
}

void SSLStreamImpl::RequireOwnProcess() const {
  if (mark_.IsFromParent()) {
    throw InvalidStateException("The TLS connection belongs to the parent process.");
  }
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
  RequireOwnProcess();
  {
    const std::lock_guard lock(mutex_);
    RequireOpen(read_.has_value(), "read");
    read_ = PendingRead{buffer, size, std::move(completion), nullptr};
  }
  AdvanceSoon();
}

void SSLStreamImpl::WriteAsync(const char* data, std::size_t size, WriteCompletion completion) {
  RequireOwnProcess();
  {
    const std::lock_guard lock(mutex_);
    RequireOpen(write_.has_value(), "write");
    write_ = PendingWrite{data, size, std::move(completion), nullptr};
  }
  AdvanceSoon();
}

void SSLStreamImpl::Close() noexcept {
  if (mark_.IsFromParent()) {
    return;
  }
  bool isStarted = false;
  {
    const std::lock_guard lock(mutex_);
    if (isClosed_) {
      return;
    }
    isClosed_ = true;
    failure_ = closedFailure_;
    isStarted = engine_ != nullptr;
  }
  below_->Close();
  if (isStarted) {
    AdvanceSoon();
  }
}

void SSLStreamImpl::AdvanceSoon() {
  {
    const std::lock_guard lock(mutex_);
    if (std::exchange(isAdvancePosted_, true)) {
      return;
    }
  }
  System::PostWith(advanceMemory_, [self = Self(this)] { self->AdvanceNow(); });
}

void SSLStreamImpl::AdvanceNow() {
  {
    const std::lock_guard lock(mutex_);
    isAdvancePosted_ = false;
  }
  Advance();
}

void SSLStreamImpl::Advance() {
  const Steps steps = PrepareSteps();
  if (steps.write) {
    WriteBelow();
  }
  if (steps.read) {
    ReadBelow();
  }
  if (steps.close) {
    below_->Close();
  }
  Complete(steps);
}

SSLStreamImpl::Steps SSLStreamImpl::PrepareSteps() {
  Steps steps;
  const std::lock_guard lock(mutex_);
  if (engine_ == nullptr) {
    return steps;
  }
  try {
    AdvanceEngine(steps);
  } catch (const Exception& error) {
    failure_ = CopyException(error);
  } catch (const std::bad_alloc&) {
    failure_ = CopyException(OutOfMemory());
  }
  // Also after a failure, since the output may be an alert for the peer.
  TakeOutput(steps);
  if (failure_ != nullptr) {
    FailPending(steps);
    steps.read = false;
  }
  steps.read = steps.read && !readingBelow_;
  readingBelow_ = readingBelow_ || steps.read;
  // A failed connection is closed, since its pending read would otherwise keep it alive until
  // somebody closes it.
  steps.close = failure_ != nullptr && !writingBelow_;
  return steps;
}

void SSLStreamImpl::TakeOutput(Steps& steps) {
  if (isClosed_ || writingBelow_ || engine_->OutputSize() == 0) {
    return;
  }
  try {
    engine_->TakeOutput(output_);
    steps.write = writingBelow_ = true;
  } catch (const std::bad_alloc&) {
    if (failure_ == nullptr) {
      failure_ = CopyException(OutOfMemory());
    }
  }
}

void SSLStreamImpl::Complete(const Steps& steps) {
  if (steps.endedHandshake) {
    steps.endedHandshake(steps.handshakeError.get());
  }
  if (steps.endedRead) {
    steps.endedRead->completion(steps.endedRead->size, steps.endedRead->error.get());
  }
  if (steps.endedWrite) {
    steps.endedWrite->completion(steps.endedWrite->error.get());
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
  steps.endedHandshake.swap(handshake_);
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
  read_->size = *bytesRead;
  steps.endedRead.swap(read_);
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
  steps.endedWrite.swap(write_);
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
SSLStreamImpl::Error SSLStreamImpl::ToFailure(const Exception& error) const noexcept {
  if (!handshake_ || dynamic_cast<const CancelledException*>(&error) != nullptr) {
    return CopyException(error);
  }
  try {
    return CopyException(engine_->HandshakeError(error.Message()));
  } catch (const std::bad_alloc&) {
    return CopyException(OutOfMemory());
  }
}

void SSLStreamImpl::FailPending(Steps& steps) {
  if (handshake_) {
    steps.endedHandshake.swap(handshake_);
    steps.handshakeError = failure_;
  }
  if (read_) {
    read_->size = 0;
    read_->error = failure_;
    steps.endedRead.swap(read_);
  }
  if (write_) {
    write_->error = failure_;
    steps.endedWrite.swap(write_);
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
  } catch (const std::bad_alloc&) {
    OnReadBelow(0, &OutOfMemory());
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
      } catch (const std::bad_alloc&) {
        failure_ = CopyException(OutOfMemory());
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
  } catch (const std::bad_alloc&) {
    OnWrittenBelow(&OutOfMemory());
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
