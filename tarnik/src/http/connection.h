#ifndef TARNIK_HTTP_CONNECTION_H
#define TARNIK_HTTP_CONNECTION_H

#include <functional>
#include <memory>
#include <mutex>
#include <optional>
#include <string>
#include <string_view>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/stream.h>

#include "support/fork.h"
#include "system/handler_memory.h"

namespace Tarnik::Http {

/// A stream that serves one exchange after the other. While it is idle a read stays under way on
/// it, so that a close by the peer, or unexpected bytes, are noticed immediately; the next exchange
/// takes that read over. Thread-safe.
class Connection final : public ObjectImpl {
 public:
  /// Empty bytes without an error mean the orderly end of the connection. Both arguments are valid
  /// only during the call.
  using ReadHandler = std::function<void(std::string_view bytes, const Exception* error)>;

  explicit Connection(Ref<System::Stream> stream);

  /// True when the stream is TLS.
  bool IsSecure() const noexcept { return isSecure_; }

  /// Reads the next bytes, or returns those that have arrived since `Claim`. One read at a time.
  /// The handler runs once, on an I/O thread; never when this function throws.
  void Read(ReadHandler handler);
  /// Writes all of `data`, which must live until the completion has run.
  void Write(std::string_view data, System::Stream::WriteCompletion completion);
  /// Does nothing in a forked child, where the connection is the parent's.
  void Close() noexcept;

  /// Starts the idle time: `onLost` runs, on an I/O thread, when the connection can no longer be
  /// used.
  void Watch(std::function<void()> onLost);
  /// Ends the idle time; false when the connection has been lost.
  bool Claim();

 private:
  /// The result of a read that ended before `Read` was called.
  struct EarlyResult {
    std::size_t size = 0;
    std::shared_ptr<const Exception> error;
  };

  ~Connection() override;

  void StartRead();
  void OnRead(std::size_t size, const Exception* error);
  void DeliverEarly();

  const Ref<System::Stream> stream_;
  const bool isSecure_;
  const ForkMark mark_;
  std::mutex mutex_;
  std::string buffer_;
  ReadHandler handler_;
  std::optional<EarlyResult> early_;
  System::HandlerMemory deliveryMemory_;
  bool isReading_ = false;
};

}  // namespace Tarnik::Http

#endif
