#ifndef TARNIK_TESTS_SUPPORT_SCRIPTED_STREAM_H
#define TARNIK_TESTS_SUPPORT_SCRIPTED_STREAM_H

#include <cstddef>
#include <functional>
#include <limits>
#include <memory>
#include <mutex>
#include <string>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/stream.h>

namespace Tarnik::Testing {

/// A stream in memory whose other end is the test: it inspects what was written and decides what is
/// read and when, byte for byte. Completions run on the I/O threads of the pool, as those of a real
/// stream do.
class ScriptedStream final : public System::Stream, public ObjectImpl {
 public:
  /// Runs after each write, on the thread of its completion and before the completion.
  using WriteHook = std::function<void(ScriptedStream& stream)>;

  struct Script {
    WriteHook onWritten;
    /// The maximum number of bytes that one read delivers.
    std::size_t pieceSize = std::numeric_limits<std::size_t>::max();
    /// A write fails once this many bytes have been accepted.
    std::size_t failWriteAt = std::numeric_limits<std::size_t>::max();
    /// Writes complete only by `ReleaseWrite` or `Close`.
    bool holdWrites = false;
  };

  explicit ScriptedStream(Script script);

  /// What the reader receives next: bytes, the end of the stream, or an error with `message`.
  void Push(const std::string& bytes);
  void PushEnd();
  void PushError(const std::string& message);

  /// Everything that has been written.
  std::string Written() const;
  bool IsClosed() const;
  /// True if a read waits for bytes.
  bool IsRead() const;
  /// Completes a held write.
  void ReleaseWrite();

  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override;
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override;
  void Close() noexcept override;

  /// The number of these streams that exist.
  static int LiveCount() noexcept;

 private:
  struct PendingRead {
    char* buffer = nullptr;
    std::size_t size = 0;
    ReadCompletion completion;
  };

  ~ScriptedStream() override;

  /// Completes the pending read if there is something for it. The caller holds the lock.
  void Serve();
  void CompleteRead(std::size_t size, std::shared_ptr<Exception> error);
  void CompleteWrite(WriteCompletion completion, std::shared_ptr<Exception> error, bool runsHook);

  const Script script_;
  mutable std::mutex mutex_;
  std::string input_;
  std::string written_;
  PendingRead read_;
  WriteCompletion heldWrite_;
  std::shared_ptr<Exception> inputError_;
  bool hasEnd_ = false;
  bool isClosed_ = false;
};

}  // namespace Tarnik::Testing

#endif
