#include "xml/builders.h"

#include <tarnik/xml/character_nodes.h>

#include "support/xml_documents.h"

namespace SsoClient {

using Tarnik::Ref;
using Tarnik::Xml::ElementNode;

AttributeMap ToAttributeMap(const AttributeList& attributes) {
  return {attributes.begin(), attributes.end()};
}

void CreateElementWithAttributes(const std::string& prefix, const std::string& localName,
                                 const AttributeMap& attributes, Ref<ElementNode>& out) {
  Tarnik::Xml::CreateElementNode(prefix, localName, out);
  for (const auto& [name, value] : attributes) {
    out->SetAttribute(name, value);
  }
}

ElementBuilderImpl::ElementBuilderImpl(std::string_view prefix, std::string_view localName,
                                       const AttributeList& attributes)
    : prefix_(prefix), localName_(localName), attributes_(ToAttributeMap(attributes)) {}

void ElementBuilderImpl::Build(Ref<ElementNode>& out) const {
  CreateElementWithAttributes(prefix_, localName_, attributes_, out);
}

TextElementBuilderImpl::TextElementBuilderImpl(std::string_view prefix, std::string_view localName,
                                               std::string_view text,
                                               const AttributeList& attributes)
    : prefix_(prefix),
      localName_(localName),
      attributes_(ToAttributeMap(attributes)),
      text_(text) {}

void TextElementBuilderImpl::Build(Ref<ElementNode>& out) const {
  CreateElementWithAttributes(prefix_, localName_, attributes_, out);
  Ref<Tarnik::Xml::TextNode> text;
  Tarnik::Xml::CreateTextNode(text);
  // Appended before its text is set: rejected text is reported with the name of its parent.
  out->AppendChild(text.get());
  text->SetText(text_.text);
}

PreBuiltElementImpl::PreBuiltElementImpl(Ref<ElementNode> element) : element_(std::move(element)) {}

void PreBuiltElementImpl::Build(Ref<ElementNode>& out) const {
  out = element_;
}

XMLCompositeBuilder::XMLCompositeBuilder(std::shared_ptr<XMLBaseBuilder> root)
    : root_(std::move(root)) {}

void XMLCompositeBuilder::Build(Ref<ElementNode>& out) const {
  root_->Build(out);
  for (const auto& child : children_) {
    Ref<ElementNode> element;
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
                                                   std::string_view localName,
                                                   const AttributeList& attributes) {
  return std::make_shared<ElementBuilderImpl>(prefix, localName, attributes);
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
  return std::make_shared<PreBuiltElementImpl>(ParseDocument(token.Xml())->RootElement());
}

}  // namespace SsoClient
