#include "http/connection.h"

#include <utility>

#include <tarnik/ssl/ssl_context.h>
#include <tarnik/text/string_util.h>

#include "core/copy_exception.h"
#include "system/post_with.h"

namespace Tarnik::Http {
namespace {

constexpr std::size_t kReadBytes = std::size_t{16} * 1024;

}  // namespace

Connection::Connection(Ref<System::Stream> stream)
    : stream_(std::move(stream)),
      isSecure_(dynamic_cast<Ssl::SSLStream*>(stream_.get()) != nullptr) {}

Connection::~Connection() {
  Close();
  StringUtil::Cleanse(buffer_);
}

void Connection::Read(ReadHandler handler) {
  std::unique_lock lock(mutex_);
  handler_ = std::move(handler);
  if (early_) {
    lock.unlock();
    // Posted, since a handler never runs inside the call that it was passed to.
    System::PostWith(deliveryMemory_, [self = Ref<Connection>(this)] { self->DeliverEarly(); });
    return;
  }
  if (std::exchange(isReading_, true)) {
    return;
  }
  lock.unlock();
  try {
    StartRead();
  } catch (...) {
    lock.lock();
    isReading_ = false;
    // Destroyed after the lock is released, since it may own the last reference to this object's
    // user.
    const ReadHandler dropped = std::exchange(handler_, nullptr);
    lock.unlock();
    throw;
  }
}

void Connection::DeliverEarly() {
  ReadHandler handler;
  std::optional<EarlyResult> early;
  {
    const std::lock_guard guard(mutex_);
    handler.swap(handler_);
    early.swap(early_);
  }
  handler({buffer_.data(), early->size}, early->error.get());
}

void Connection::StartRead() {
  buffer_.resize(kReadBytes);
  stream_->ReadAsync(buffer_.data(), buffer_.size(),
                     [self = Ref<Connection>(this)](std::size_t size, const Exception* error) {
                       self->OnRead(size, error);
                     });
}

void Connection::OnRead(std::size_t size, const Exception* error) {
  ReadHandler handler;
  {
    const std::lock_guard guard(mutex_);
    isReading_ = false;
    handler.swap(handler_);
    if (!handler) {
      early_.emplace(EarlyResult{size, error == nullptr ? nullptr : CopyException(*error)});
      return;
    }
  }
  handler({buffer_.data(), size}, error);
}

void Connection::Write(std::string_view data, System::Stream::WriteCompletion completion) {
  stream_->WriteAsync(data.data(), data.size(), std::move(completion));
}

void Connection::Close() noexcept {
  // A stream of a caller may have locks that a thread of the parent held.
  if (!mark_.IsFromParent()) {
    stream_->Close();
  }
}

void Connection::Watch(std::function<void()> onLost) {
  // The last answer must not stay in memory during the idle time.
  StringUtil::Cleanse(buffer_);
  Read([onLost = std::move(onLost)](std::string_view, const Exception*) { onLost(); });
}

bool Connection::Claim() {
  ReadHandler watch;
  const std::lock_guard guard(mutex_);
  watch.swap(handler_);
  return isReading_;
}

}  // namespace Tarnik::Http
