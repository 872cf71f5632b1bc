#include "xml/builders.h"

#include <tarnik/core/checked_cast.h>
#include <tarnik/core/reader.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/xml_parser.h>

namespace SsoClient {

AttributeMap ToAttributeMap(const AttributeList& attributes) {
  return {attributes.begin(), attributes.end()};
}

ElementBuilderImpl::ElementBuilderImpl(std::string_view prefix, std::string_view localName,
                                       const AttributeList& attributes)
    : prefix_(prefix), localName_(localName), attributes_(ToAttributeMap(attributes)) {}

void ElementBuilderImpl::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  CreateElementWithAttributes(prefix_, localName_, attributes_, out);
}

void CreateElementWithAttributes(const std::string& prefix, const std::string& localName,
                                 const AttributeMap& attributes,
                                 Tarnik::Ref<Tarnik::Xml::ElementNode>& out) {
  Tarnik::Xml::CreateElementNode(prefix, localName, out);
  for (const auto& [name, value] : attributes) {
    out->SetAttribute(name, value);
  }
}

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

PreBuiltElementImpl::PreBuiltElementImpl(Tarnik::Ref<Tarnik::Xml::ElementNode> element)
    : element_(std::move(element)) {}

void PreBuiltElementImpl::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  out = element_;
}

XMLCompositeBuilder::XMLCompositeBuilder(std::shared_ptr<XMLBaseBuilder> root)
    : root_(std::move(root)) {}

void XMLCompositeBuilder::Build(Tarnik::Ref<Tarnik::Xml::ElementNode>& out) const {
  root_->Build(out);
  for (const auto& child : children_) {
    Tarnik::Ref<Tarnik::Xml::ElementNode> element;
    child->Build(element);
    out->AppendChild(element.get());
  }
}

XMLCompositeBuilder& XMLCompositeBuilder::Add(std::shared_ptr<XMLBaseBuilder> child) {
  if (child != nullptr) {
    children_.push_back(std::move(child));
  }
  return *this;
}

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
