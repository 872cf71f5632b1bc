#include "token/child_cursor.h"

#include <utility>

#include <ssoclient/exceptions.h>
#include <tarnik/xml/character_nodes.h>

#include "support/concat.h"

namespace SsoClient {

using Tarnik::Xml::ElementNode;
using Tarnik::Xml::Node;
using Tarnik::Xml::NodeKind;

bool SkipWsAndCommentsFilter::IsVisible(const Node& node) const {
  if (node.Kind() == NodeKind::kComment) {
    return false;
  }
  if (node.Kind() != NodeKind::kText) {
    return true;
  }
  const std::string_view text = static_cast<const Tarnik::Xml::TextNode&>(node).Text();
  return text.find_first_not_of("\t\n\r ") != std::string_view::npos;
}

ElementNode* AsElement(Node* node) noexcept {
  if (node == nullptr || node->Kind() != NodeKind::kElement) {
    return nullptr;
  }
  return static_cast<ElementNode*>(node);
}

ElementNode& ExpectElement(Node* node, std::string_view localName, std::string_view namespaceUri) {
  ElementNode* element = AsElement(node);
  if (element == nullptr || element->LocalName() != localName) {
    throw ParseException(Concat({"Expected element '", localName, "' not found."}));
  }
  if (element->NamespaceUri() != namespaceUri) {
    throw ParseException(
        Concat({"Element '", element->QualifiedNameText(), "' has unexpected namespace"}));
  }
  return *element;
}

ChildCursor::ChildCursor(const ElementNode& parent, std::shared_ptr<const NodeFilter> filter)
    : parent_(&parent), filter_(std::move(filter)), current_(parent.FirstChild()) {
  SkipHidden();
}

bool ChildCursor::IsAtElement(std::string_view localName) const noexcept {
  const ElementNode* element = AsElement(current_);
  return element != nullptr && element->LocalName() == localName;
}

const ElementNode& ChildCursor::TakeElement(std::string_view localName,
                                            std::string_view namespaceUri) {
  const ElementNode& element = ExpectElement(current_, localName, namespaceUri);
  Advance();
  return element;
}

void ChildCursor::Advance() {
  current_ = current_->NextSibling();
  SkipHidden();
}

void ChildCursor::ExpectEnd(const char* message) const {
  if (!IsAtEnd()) {
    throw ParseException(message);
  }
}

void ChildCursor::SkipHidden() {
  while (current_ != nullptr && !filter_->IsVisible(*current_)) {
    current_ = current_->NextSibling();
  }
}

}  // namespace SsoClient
