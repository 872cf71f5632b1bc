#ifndef TARNIK_XML_OUTPUT_BUFFER_H
#define TARNIK_XML_OUTPUT_BUFFER_H

#include <array>
#include <cstddef>
#include <cstring>
#include <string_view>

#include <tarnik/core/writer.h>

namespace Tarnik::Xml {

/// Collects small pieces of XML text into large writes.
class OutputBuffer {
 public:
  explicit OutputBuffer(Writer& writer) noexcept : writer_(writer) {}
  OutputBuffer(const OutputBuffer&) = delete;
  OutputBuffer& operator=(const OutputBuffer&) = delete;
  /// Cleanses the buffer without writing it.
  ~OutputBuffer();

  void Append(char character) {
    if (used_ == buffer_.size()) {
      Flush();
    }
    buffer_[used_++] = character;
  }

  void Append(std::string_view text) {
    if (text.size() > buffer_.size() - used_) {
      AppendLarge(text);
      return;
    }
    if (!text.empty()) {  // an empty view may have no data at all
      std::memcpy(buffer_.data() + used_, text.data(), text.size());
      used_ += text.size();
    }
  }

  /// Character data, escaped as in Canonical XML 1.0, section 2.3.
  void AppendText(std::string_view text);
  /// The value of an attribute, without its quotes, escaped as in the same section.
  void AppendAttributeValue(std::string_view value);
  void AppendComment(std::string_view text);
  void AppendProcessingInstruction(std::string_view target, std::string_view text);

  /// Writes all buffered text to the writer. Must be called at the end.
  void Flush();

 private:
  static constexpr std::size_t kBytes = 4096;

  void AppendLarge(std::string_view text);

  Writer& writer_;
  std::size_t used_ = 0;
  std::size_t mostUsed_ = 0;
  std::array<char, kBytes> buffer_;
};

}  // namespace Tarnik::Xml

#endif
