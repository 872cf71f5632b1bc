#ifndef TARNIK_CORE_WRITER_H
#define TARNIK_CORE_WRITER_H

#include <string>
#include <string_view>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>

namespace Tarnik {

/// A sink of bytes. Used by one thread at a time.
class TARNIK_EXPORT Writer : public virtual Object {
 public:
  /// Appends all of `text`.
  virtual void Write(std::string_view text) = 0;
};

/// A writer that keeps everything written in memory, which is cleansed when the writer is
/// destroyed.
class TARNIK_EXPORT StringWriter : public Writer {
 public:
  /// Everything written so far; valid until the next write.
  virtual const std::string& Text() const = 0;
  /// Moves out everything written so far and leaves the writer empty.
  virtual std::string TakeText() = 0;
};

/// An empty writer.
TARNIK_EXPORT Ref<StringWriter> CreateStringWriter();

}  // namespace Tarnik

#endif
