#include "xml/builder_factories.h"

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/xml_parser.h>

#include "xml/element_builder_impl.h"
#include "xml/pre_built_element_impl.h"
#include "xml/text_element_builder_impl.h"

namespace SsoClient {

std::shared_ptr<XMLBaseBuilder> MakeElementBuilder(std::string_view prefix,
                                                   std::string_view localName) {
  return MakeElementBuilder(prefix, localName, {});
}

std::shared_ptr<XMLBaseBuilder> MakeElementBuilder(std::string_view prefix,
                                                   std::string_view localName,
                                                   const AttributeList& attributes) {
  return std::make_shared<ElementBuilderImpl>(prefix, localName, attributes);
}

std::shared_ptr<XMLBaseBuilder> MakeTextElementBuilder(std::string_view prefix,
                                                       std::string_view localName,
                                                       std::string_view text) {
  return MakeTextElementBuilder(prefix, localName, text, {});
}

std::shared_ptr<XMLBaseBuilder> MakeTextElementBuilder(std::string_view prefix,
                                                       std::string_view localName,
                                                       std::string_view text,
                                                       const AttributeList& attributes) {
  return std::make_shared<TextElementBuilderImpl>(prefix, localName, text, attributes);
}

std::shared_ptr<XMLCompositeBuilder> MakeCompositeBuilder(std::string_view prefix,
                                                          std::string_view localName,
                                                          const AttributeList& attributes) {
  return std::make_shared<XMLCompositeBuilder>(MakeElementBuilder(prefix, localName, attributes));
}

std::shared_ptr<XMLBaseBuilder> MakeTokenElementBuilder(const SamlToken& token) {
  const auto reader = Tarnik::CreateStringReader(token.Xml());
  const auto handler = Tarnik::Xml::CreateXMLDocumentHandler();
  const auto parsed = Tarnik::Xml::CreateXMLParser(reader.get(), handler.get())->Parse();
  const auto* document = Tarnik::CheckedCast<const Tarnik::Xml::Document>(parsed.get());
  return std::make_shared<PreBuiltElementImpl>(document->RootElement());
}

}  // namespace SsoClient
