#ifndef TARNIK_SYSTEM_STREAM_H
#define TARNIK_SYSTEM_STREAM_H

#include <cstddef>
#include <functional>

#include <tarnik/core/exception.h>
#include <tarnik/core/object.h>

namespace Tarnik::System {

/// A two-way stream of bytes, driven by completions.
///
/// At most one read and one write may be under way at once. The caller owns the buffers and must
/// keep them alive until the completion has run. Each completion runs exactly once, on an I/O
/// thread of the pool and never inside the call that started the operation; it must not block. The
/// exception is null on success and valid only during the call. The stream keeps itself alive while
/// an operation is under way.
///
/// An exception that leaves a completion ends the process; this includes `std::bad_alloc`, so a
/// completion that allocates catches it. An allocation of the platform's own that fails on an I/O
/// thread is a failure of the operation.
///
/// A stream belongs to the process that opened it. In a child that was forked later, `Close` does
/// nothing, and the other functions throw `InvalidStateException`.
class TARNIK_EXPORT Stream : public virtual Object {
 public:
  /// Receives the number of bytes read, and null or the exception.
  using ReadCompletion = std::function<void(std::size_t bytesRead, Exception* error)>;
  /// Receives null when all bytes were written, or the exception.
  using WriteCompletion = std::function<void(Exception* error)>;

  /// Reads at least one and at most `size` bytes. Zero bytes without an error mean the orderly
  /// end of the stream.
  virtual void ReadAsync(char* buffer, std::size_t size, ReadCompletion completion) = 0;
  /// Writes all `size` bytes.
  virtual void WriteAsync(const char* data, std::size_t size, WriteCompletion completion) = 0;
  /// Closes immediately, without notifying the peer. Operations under way complete with a
  /// `CancelledException`. May be called from any thread, any number of times.
  virtual void Close() noexcept = 0;
};

}  // namespace Tarnik::System

#endif
