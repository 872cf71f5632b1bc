#ifndef TARNIK_TESTS_SUPPORT_SCRIPTED_STREAM_H
#define TARNIK_TESTS_SUPPORT_SCRIPTED_STREAM_H

#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/system/stream.h>

#include <functional>
#include <limits>
#include <memory>
#include <mutex>
#include <string>

namespace Tarnik::Testing {

/// A stream in memory whose other end is the test: it sees what was written and decides what is
/// read, byte for byte, and when. Completions run on the pool's I/O threads, as a real stream's.
class ScriptedStream final : public System::Stream, public ObjectImpl {
 public:
  /// Runs after each write, on the thread of its completion and before it.
  using WriteHook = std::function<void(ScriptedStream& stream)>;

  struct Script {
    WriteHook onWritten;
    /// The most bytes that one read delivers.
    std::size_t pieceSize = std::numeric_limits<std::size_t>::max();
    /// A write fails once this many bytes have been taken.
    std::size_t failWriteAt = std::numeric_limits<std::size_t>::max();
    /// Writes never complete but by `Close`.
    bool holdWrites = false;
  };

  explicit ScriptedStream(Script script);

  /// Lets the reader have `bytes`, then the end, then an error that says `message`.
  void Push(const std::string& bytes);
  void PushEnd();
  void PushError(const std::string& message);

  /// All that has been written.
  std::string Written() const;
  bool IsClosed() const;
  /// True when a read waits for bytes.
  bool IsRead() const;
  /// Completes a write that the script holds.
  void ReleaseWrite();

  void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) override;
  void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) override;
  void Close() noexcept override;

  /// How many of these streams live.
  static int LiveCount() noexcept;

 private:
  struct PendingRead {
    char* buffer = nullptr;
    std::size_t size = 0;
    ReadCompletion completion;
  };

  ~ScriptedStream() override;

  /// Completes the read under way if there is something for it. Called with the lock held.
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
