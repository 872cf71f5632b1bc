#include <tarnik/core/writer.h>

#include <algorithm>
#include <utility>

#include <tarnik/core/object_impl.h>
#include <tarnik/text/string_util.h>

namespace Tarnik {
namespace {

// Texts may hold passwords: what a growing buffer leaves behind is cleansed.
class StringWriterImpl final : public StringWriter, public ObjectImpl {
 public:
  void Write(std::string_view text) override {
    if (text_.capacity() - text_.size() < text.size()) {
      Grow(text_.size() + text.size());
    }
    text_.append(text);
  }

  const std::string& Text() const override { return text_; }

  std::string TakeText() override {
    std::string text = std::move(text_);
    // A short text lies inside the string object and is copied, not moved away.
    StringUtil::Cleanse(text_);
    return text;
  }

 private:
  ~StringWriterImpl() override { StringUtil::Cleanse(text_); }

  void Grow(std::size_t needed) {
    std::string larger;
    larger.reserve(std::max(needed, 2 * text_.capacity()));
    larger.append(text_);
    StringUtil::Cleanse(text_);
    text_.swap(larger);
  }

  std::string text_;
};

}  // namespace

Ref<StringWriter> CreateStringWriter() {
  return Ref<StringWriter>(new StringWriterImpl);
}

}  // namespace Tarnik
