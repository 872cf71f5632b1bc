#ifndef TARNIK_TESTS_SUPPORT_XML_TEXT_H
#define TARNIK_TESTS_SUPPORT_XML_TEXT_H

#include <string>
#include <string_view>

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/xml_parser.h>
#include <tarnik/xml/xml_writer.h>

namespace Tarnik::Testing {

inline Ref<Xml::Document> ParseXml(Reader* reader) {
  const Ref<Xml::XMLHandler> handler = Xml::CreateXMLDocumentHandler();
  const Ref<Object> parsed = Xml::CreateXMLParser(reader, handler.get())->Parse();
  return Ref<Xml::Document>(CheckedCast<Xml::Document>(parsed.get()));
}

inline Ref<Xml::Document> ParseXml(std::string_view text) {
  return ParseXml(CreateStringReader(std::string(text)).get());
}

inline std::string XmlText(const Xml::Node* node) {
  const Ref<StringWriter> writer = CreateStringWriter();
  Xml::WriteXml(node, writer.get());
  return writer->TakeText();
}

}  // namespace Tarnik::Testing

#endif
