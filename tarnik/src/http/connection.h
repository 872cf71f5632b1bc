#ifndef TARNIK_HTTP_CONNECTION_H
#define TARNIK_HTTP_CONNECTION_H

#include <functional>
#include <memory>
#include <mutex>
#include <string>
#include <string_view>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/stream.h>

namespace Tarnik::Http {

/// A stream that serves one exchange after the other. While it is idle a read stays under way on
/// it, so that the peer's close, or bytes that nobody asked for, are seen when they come; the next
/// exchange takes that read over. Safe from many threads.
class Connection final : public ObjectImpl {
 public:
  /// Empty bytes without an error are the orderly end of the connection. Both arguments are valid
  /// only during the call.
  using ReadHandler = std::function<void(std::string_view bytes, const Exception* error)>;

  explicit Connection(Ref<System::Stream> stream);

  /// True when the stream is TLS.
  bool IsSecure() const noexcept { return isSecure_; }

  /// Waits for the next bytes, or for those that have come since `Claim`. One read at a time. The
  /// handler runs once, on an I/O thread.
  void Read(ReadHandler handler);
  /// Writes all of `data`, which must live until the completion has run.
  void Write(std::string_view data, System::Stream::WriteCompletion completion);
  void Close() noexcept;

  /// Begins to be idle: `onLost` runs, on an I/O thread, when the connection turns out to be of no
  /// further use.
  void Watch(std::function<void()> onLost);
  /// Ends being idle; false when the connection has been lost.
  bool Claim();

 private:
  /// What a read that nobody waited for has brought.
  struct EarlyResult {
    std::size_t size = 0;
    std::shared_ptr<const Throwable> error;
  };

  ~Connection() override;

  void StartRead();
  void OnRead(std::size_t size, const Exception* error);
  void DeliverEarly(ReadHandler handler);

  const Ref<System::Stream> stream_;
  const bool isSecure_;
  std::mutex mutex_;
  std::string buffer_;
  ReadHandler handler_;
  std::unique_ptr<EarlyResult> early_;
  bool isReading_ = false;
};

}  // namespace Tarnik::Http

#endif
