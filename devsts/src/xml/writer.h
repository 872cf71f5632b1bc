#ifndef DEVSTS_XML_WRITER_H
#define DEVSTS_XML_WRITER_H

#include <string>
#include <string_view>
#include <utility>
#include <vector>

namespace DevSts {

// Escapes the characters that XML 1.0 reserves, for element content as well as attribute values.
std::string EscapeXml(std::string_view text);

// Writes elements to a text in document order.
class XmlWriter {
 public:
  using Attributes = std::vector<std::pair<std::string, std::string>>;

  explicit XmlWriter(bool indent = false) : indent_(indent) {}

  void Open(const std::string& name, const Attributes& attributes = {});
  void Close();
  // An element that contains only text, or nothing.
  void Leaf(const std::string& name, const Attributes& attributes, std::string_view text);
  void Leaf(const std::string& name, std::string_view text) { Leaf(name, {}, text); }
  // Appends markup unchanged.
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
