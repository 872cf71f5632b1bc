#include "xml/text_element_builder_impl.h"

#include <tarnik/text/string_util.h>
#include <tarnik/xml/character_nodes.h>

#include "xml/element_builder_impl.h"

namespace SsoClient {

TextElementBuilderImpl::TextElementBuilderImpl(std::string_view prefix, std::string_view localName,
                                               std::string_view text,
                                               const AttributeList& attributes)
    : prefix_(prefix),
      localName_(localName),
      attributes_(ToAttributeMap(attributes)),
      text_(text) {}

TextElementBuilderImpl::~TextElementBuilderImpl() {
  Tarnik::StringUtil::Cleanse(text_);
}

void TextElementBuilderImpl::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  CreateElementWithAttributes(prefix_, localName_, attributes_, out);
  Tarnik::Ref<Tarnik::Xml::TextNode> text;
  Tarnik::Xml::CreateTextNode(text);
  // Before it has its text: what a text node refuses it tells by the element that holds it.
  out->AppendChild(text.get());
  text->SetText(text_);
}

}  // namespace SsoClient
