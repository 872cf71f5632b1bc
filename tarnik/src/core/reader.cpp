#include <algorithm>
#include <cstring>
#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/core/reader.h>

#include "support/cleanse.h"

namespace Tarnik {
namespace {

class StringReader final : public Reader, public ObjectImpl {
 public:
  explicit StringReader(std::string text) : text_(std::move(text)) {}

  std::size_t Read(char* buffer, std::size_t size) override {
    const std::size_t count = std::min(size, text_.size() - position_);
    if (count != 0) {
      std::memcpy(buffer, text_.data() + position_, count);
    }
    position_ += count;
    return count;
  }

 private:
  ~StringReader() override { CleanseBuffer(text_); }

  std::string text_;
  std::size_t position_ = 0;
};

}  // namespace

Ref<Reader> CreateStringReader(std::string text) {
  return Ref<Reader>(new StringReader(std::move(text)));
}

}  // namespace Tarnik
