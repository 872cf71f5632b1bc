#ifndef DEVSTS_XML_WRITER_H
#define DEVSTS_XML_WRITER_H

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace DevSts {

// Text with the characters escaped that XML 1.0 reserves; right for content and attribute values.
std::string EscapeXml(std::string_view text);

// Writes elements one after another into a text.
class XmlWriter {
 public:
  using Attributes = std::vector<std::pair<std::string, std::string>>;

  explicit XmlWriter(bool indent = false) : indent_(indent) {}

  void Open(const std::string& name, const Attributes& attributes = {});
  void Close();
  // An element with text only, or an empty one.
  void Leaf(const std::string& name, const Attributes& attributes, std::string_view text);
  void Leaf(const std::string& name, std::string_view text) { Leaf(name, {}, text); }
  // Markup as it is.
  void Raw(std::string_view markup) { text_ += markup; }

  const std::string& Text() const { return text_; }

 private:
  void StartLine();
  void WriteTag(const std::string& name, const Attributes& attributes);

  bool indent_;
  std::string text_;
  std::vector<std::string> open_;
};

}  // namespace DevSts

#endif
