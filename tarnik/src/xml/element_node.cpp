#include <algorithm>
#include <limits>
#include <memory>
#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/xml/element_node.h>

#include "support/quote.h"
#include "xml/equal_prefixes.h"
#include "xml/namespaces.h"
#include "xml/tree_builder.h"
#include "xml/xml_chars.h"

namespace Tarnik::Xml {

namespace {

constexpr unsigned kFirstAttributeCapacity = 4;

void CheckAttribute(const ElementNode& element, std::string_view name, std::string_view value) {
  if (!IsQualifiedName(name)) {
    throw InvalidArgumentException("An attribute name of element " +
                                   QuoteVerbatim(element.QualifiedNameText()) +
                                   " is not a qualified name.");
  }
  if (!IsXmlText(value)) {
    throw InvalidArgumentException("Attribute " + QuoteVerbatim(name) + " of element " +
                                   QuoteVerbatim(element.QualifiedNameText()) +
                                   " holds what XML cannot carry: a control character or bytes "
                                   "that are not UTF-8.");
  }
  if (value.size() > std::numeric_limits<unsigned>::max()) {
    throw InvalidArgumentException("Attribute " + QuoteVerbatim(name) + " of element " +
                                   QuoteVerbatim(element.QualifiedNameText()) + " is too long.");
  }
}

}  // namespace

QualifiedName Attribute::Qualified() const noexcept {
  return {name_->Full(), name_->prefixLength};
}

bool Attribute::IsNamespaceDeclaration() const noexcept {
  return name_->isDeclaration;
}

std::string_view ElementNode::QualifiedNameText() const noexcept {
  return name_->Full();
}

std::string_view ElementNode::Prefix() const noexcept {
  return name_->Prefix();
}

std::string_view ElementNode::LocalName() const noexcept {
  return name_->Local();
}

std::string_view ElementNode::NamespaceUri() const noexcept {
  return LookupNamespace(Prefix()).value_or(std::string_view());
}

std::optional<std::string_view> ElementNode::LookupNamespace(
    std::string_view prefix) const noexcept {
  if (prefix == "xml") {
    return kXmlNamespace;
  }
  // The parent of an element is an element or the document.
  for (const Node* node = this; node != nullptr && node->kind_ == NodeKind::kElement;
       node = node->parent_) {
    const auto* element = static_cast<const ElementNode*>(node);
    if (element->declaresNamespaces_ == 0) {
      continue;
    }
    for (unsigned index = 0; index < element->attributeCount_; ++index) {
      const Attribute& attribute = element->attributes_[index];
      if (attribute.name_->isDeclaration &&
          EqualPrefixes(attribute.name_->DeclaredPrefix(), prefix)) {
        return attribute.Value();
      }
    }
  }
  return std::nullopt;
}

ElementNode* ElementNode::NextElement(const ElementNode* top) const noexcept {
  const ElementNode* element = this;
  Node* next = FirstChild();
  for (;;) {
    for (; next != nullptr; next = next->NextSibling()) {
      if (next->Kind() == NodeKind::kElement) {
        return static_cast<ElementNode*>(next);
      }
    }
    if (element == top) {
      return nullptr;
    }
    next = element->NextSibling();
    element = element->ParentElement();
  }
}

std::size_t ElementNode::AttributeCount() const noexcept {
  return attributeCount_;
}

const Attribute& ElementNode::AttributeAt(std::size_t index) const noexcept {
  return attributes_[index];
}

std::optional<std::string_view> ElementNode::FindAttribute(
    std::string_view qualifiedName) const noexcept {
  const Attribute* attribute = FindQualified(qualifiedName);
  return attribute == nullptr ? std::nullopt : std::optional(attribute->Value());
}

std::optional<std::string_view> ElementNode::FindAttribute(
    std::string_view namespaceUri, std::string_view localName) const noexcept {
  for (unsigned index = 0; index < attributeCount_; ++index) {
    const Attribute& attribute = attributes_[index];
    if (attribute.name_->isDeclaration || attribute.name_->Local() != localName) {
      continue;
    }
    // The default namespace does not apply to attributes (Namespaces in XML 1.0, section 6.2).
    const std::string_view prefix = attribute.name_->Prefix();
    const bool found = prefix.empty()
                           ? namespaceUri.empty()
                           : !namespaceUri.empty() && LookupNamespace(prefix) == namespaceUri;
    if (found) {
      return attribute.Value();
    }
  }
  return std::nullopt;
}

void ElementNode::SetAttribute(std::string_view qualifiedName, std::string_view value) {
  CheckAttribute(*this, qualifiedName, value);
  if (Attribute* attribute = FindQualified(qualifiedName)) {
    *attribute = TreeBuilder::MakeAttribute(attribute->name_, tree_->Store(value));
    return;
  }
  AddAttribute(TreeBuilder::MakeAttribute(tree_->StoreName(qualifiedName), tree_->Store(value)));
}

bool ElementNode::RemoveAttribute(std::string_view qualifiedName) noexcept {
  Attribute* attribute = FindQualified(qualifiedName);
  if (attribute == nullptr) {
    return false;
  }
  std::copy(attribute + 1, attributes_ + attributeCount_, attribute);
  --attributeCount_;
  return true;
}

Attribute* ElementNode::FindQualified(std::string_view qualifiedName) const noexcept {
  Attribute* const end = attributes_ + attributeCount_;
  Attribute* found = std::find_if(attributes_, end, [qualifiedName](const Attribute& attribute) {
    return attribute.name_->Full() == qualifiedName;
  });
  return found == end ? nullptr : found;
}

void ElementNode::AddAttribute(const Attribute& attribute) {
  if (attributeCount_ == attributeCapacity_) {
    const unsigned capacity = std::max(kFirstAttributeCapacity, attributeCount_ * 2);
    auto* grown = tree_->Allocate<Attribute>(capacity);
    std::uninitialized_copy(attributes_, attributes_ + attributeCount_, grown);
    attributes_ = grown;
    attributeCapacity_ = capacity & 0x7FFFFFFFU;
  }
  new (attributes_ + attributeCount_) Attribute(attribute);
  ++attributeCount_;
  declaresNamespaces_ |= attribute.name_->isDeclaration ? 1U : 0U;
}

void CreateElementNode(std::string_view prefix, std::string_view localName,
                       Ref<ElementNode>& element) {
  if (!IsNCName(localName) || (!prefix.empty() && !IsNCName(prefix))) {
    throw InvalidArgumentException("The prefix and the local name of an element must be NCNames.");
  }
  const std::string name =
      prefix.empty() ? std::string(localName) : std::string(prefix) + ":" + std::string(localName);
  const Tree::Holder tree = Tree::Create(Tree::kNodeBlockBytes);
  element = TreeBuilder::NewElement(*tree, tree->StoreName(name));
}

}  // namespace Tarnik::Xml
