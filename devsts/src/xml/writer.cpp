#include "xml/writer.h"

namespace DevSts {

std::string EscapeXml(std::string_view text) {
  std::string escaped;
  for (const char c : text) {
    switch (c) {
      case '&':
        escaped += "&amp;";
        break;
      case '<':
        escaped += "&lt;";
        break;
      case '>':
        escaped += "&gt;";
        break;
      case '"':
        escaped += "&quot;";
        break;
      case '\t':
        escaped += "&#9;";
        break;
      case '\n':
        escaped += "&#10;";
        break;
      case '\r':
        escaped += "&#13;";
        break;
      default:
        escaped += c;
    }
  }
  return escaped;
}

void XmlWriter::Open(const std::string& name, const Attributes& attributes) {
  StartLine();
  WriteTag(name, attributes);
  text_ += '>';
  open_.push_back(name);
}

void XmlWriter::Close() {
  const std::string name = open_.back();
  open_.pop_back();
  StartLine();
  text_ += "</" + name + ">";
}

void XmlWriter::Leaf(const std::string& name, const Attributes& attributes, std::string_view text) {
  StartLine();
  WriteTag(name, attributes);
  if (text.empty()) {
    text_ += "/>";
    return;
  }
  text_ += ">" + EscapeXml(text) + "</" + name + ">";
}

void XmlWriter::StartLine() {
  if (indent_ && !text_.empty()) {
    text_ += "\n" + std::string(2 * open_.size(), ' ');
  }
}

void XmlWriter::WriteTag(const std::string& name, const Attributes& attributes) {
  text_ += "<" + name;
  for (const auto& [attribute, value] : attributes) {
    text_ += " " + attribute + "=\"" + EscapeXml(value) + "\"";
  }
}

}  // namespace DevSts
