#ifndef TARNIK_TESTS_XML_PIECE_READER_H
#define TARNIK_TESTS_XML_PIECE_READER_H

#include <algorithm>
#include <cstddef>
#include <string>
#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>

namespace Tarnik::Testing {

/// Returns a text in pieces of a fixed size.
class PieceReader final : public Reader, public ObjectImpl {
 public:
  PieceReader(std::string text, std::size_t piece) : text_(std::move(text)), piece_(piece) {}

  std::size_t Read(char* buffer, std::size_t size) override {
    const std::size_t count = std::min({size, piece_, text_.size() - position_});
    text_.copy(buffer, count, position_);
    position_ += count;
    return count;
  }

 private:
  std::string text_;
  std::size_t piece_;
  std::size_t position_ = 0;
};

}  // namespace Tarnik::Testing

#endif
