#ifndef SSOCLIENT_TESTS_SUPPORT_PARSE_XML_H
#define SSOCLIENT_TESTS_SUPPORT_PARSE_XML_H

#include <string>
#include <string_view>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_parser.h>
#include <tarnik/xml/xml_writer.h>

namespace SsoClient::Testing {

/// Parses a document as the library does.
inline Tarnik::Ref<Tarnik::Xml::Document> ParseXml(const std::string& text) {
  const auto reader = Tarnik::CreateStringReader(text);
  const auto handler = Tarnik::Xml::CreateXMLDocumentHandler();
  const auto parsed = Tarnik::Xml::CreateXMLParser(reader.get(), handler.get())->Parse();
  return Tarnik::Ref<Tarnik::Xml::Document>(
      Tarnik::CheckedCast<Tarnik::Xml::Document>(parsed.get()));
}

inline std::string XmlText(const Tarnik::Xml::Node* node) {
  const auto writer = Tarnik::CreateStringWriter();
  Tarnik::Xml::WriteXml(node, writer.get());
  return writer->TakeText();
}

/// The first element with this local name in document order, including `root`; null if there is
/// no such element.
inline Tarnik::Xml::ElementNode* FindElement(Tarnik::Xml::ElementNode* root,
                                             std::string_view localName) {
  Tarnik::Xml::ElementNode* element = root;
  while (element != nullptr && element->LocalName() != localName) {
    element = element->NextElement(root);
  }
  return element;
}

}  // namespace SsoClient::Testing

#endif
