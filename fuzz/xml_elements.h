#ifndef FUZZ_XML_ELEMENTS_H
#define FUZZ_XML_ELEMENTS_H

#include <map>
#include <optional>
#include <string>
#include <vector>

namespace Fuzz {

/// An element as an application sees it: without prefixes, comments and processing instructions.
struct Element {
  std::string namespaceUri;
  std::string name;
  /// Without namespace declarations; "{namespace}name" for one with a prefix.
  std::map<std::string, std::string> attributes = {};
  /// The text directly in it.
  std::string text = {};
  std::vector<Element> children = {};

  bool operator==(const Element&) const = default;
};

/// The root element of `xml` as libxml2 reads it, or nothing if it refuses the text.
std::optional<Element> ReadWithLibXml2(const std::string& xml);

/// True for a text of characters that XML 1.0 allows, in UTF-8 as libxml2 reads it.
bool IsXmlText(const std::string& text);

}  // namespace Fuzz

#endif
