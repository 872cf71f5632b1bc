#ifndef SSOCLIENT_TESTS_XML_BUILT_XML_H
#define SSOCLIENT_TESTS_XML_BUILT_XML_H

#include <algorithm>
#include <cstddef>
#include <initializer_list>
#include <stdexcept>
#include <string>
#include <string_view>

#include <tarnik/core/ref.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/element_node.h>

#include "support/parse_xml.h"
#include "xml/builders.h"

namespace SsoClient::Testing {

inline Tarnik::Ref<Tarnik::Xml::ElementNode> Built(const XMLBaseBuilder& builder) {
  Tarnik::Ref<Tarnik::Xml::ElementNode> element;
  builder.Build(element);
  return element;
}

inline std::string BuiltXml(const XMLBaseBuilder& builder) {
  return XmlText(Built(builder).get());
}

/// `xml` with "TIME" in place of every text of the form `kTimeForm`.
inline std::string WithoutTimes(const std::string& xml) {
  constexpr std::string_view kTimeForm = ">dddd-dd-ddTdd:dd:dd.dddZ<";
  const auto matches = [](char pattern, char actual) {
    return pattern == 'd' ? actual >= '0' && actual <= '9' : actual == pattern;
  };
  std::string result;
  std::size_t position = 0;
  while (position < xml.size()) {
    const std::string_view rest = std::string_view(xml).substr(position, kTimeForm.size());
    if (std::equal(kTimeForm.begin(), kTimeForm.end(), rest.begin(), rest.end(), matches)) {
      result += ">TIME";
      position += kTimeForm.size() - 1;
      continue;
    }
    result += xml[position];
    ++position;
  }
  return result;
}

/// The date-time in the first descendant on `path` of local names.
inline Tarnik::System::DateTime TimeAt(const Tarnik::Xml::ElementNode& element,
                                       std::initializer_list<std::string_view> path) {
  const Tarnik::Xml::ElementNode* current = &element;
  for (const auto name : path) {
    current = current->FirstChildElement(name);
    if (current == nullptr) {
      throw std::runtime_error("no element " + std::string(name));
    }
  }
  const auto* text = dynamic_cast<const Tarnik::Xml::TextNode*>(current->FirstChild());
  return Tarnik::System::DateTime::Parse(text->Text());
}

}  // namespace SsoClient::Testing

#endif
