#ifndef TARNIK_CORE_READER_H
#define TARNIK_CORE_READER_H

#include <cstddef>
#include <string>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>

namespace Tarnik {

/// A source of bytes that is read once, from front to back. Used by one thread at a time.
class TARNIK_EXPORT Reader : public virtual Object {
 public:
  /// Reads up to `size` bytes into `buffer` and returns their number: 0 only at the end, or if
  /// `size` is 0.
  virtual std::size_t Read(char* buffer, std::size_t size) = 0;
};

/// A reader of `text`, which it owns; the text is cleansed when the reader is destroyed.
TARNIK_EXPORT Ref<Reader> CreateStringReader(std::string text);

}  // namespace Tarnik

#endif
