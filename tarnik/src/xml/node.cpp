#include <tarnik/core/exception.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/node.h>

#include "support/quote.h"
#include "xml/tree.h"
#include "xml/tree_builder.h"

namespace Tarnik::Xml {

namespace {

ElementNode* AsElement(Node* node) noexcept {
  return node != nullptr && node->Kind() == NodeKind::kElement ? static_cast<ElementNode*>(node)
                                                               : nullptr;
}

bool HoldsElement(const ParentNode& parent, const Node* except) noexcept {
  for (const Node* node = parent.FirstChild(); node != nullptr; node = node->NextSibling()) {
    if (node->Kind() == NodeKind::kElement && node != except) {
      return true;
    }
  }
  return false;
}

void CheckChildOfDocument(const ParentNode& document, const Node& child) {
  if (child.Kind() == NodeKind::kText) {
    throw InvalidArgumentException("A text cannot be a child of a document.");
  }
  if (child.Kind() == NodeKind::kElement && HoldsElement(document, &child)) {
    throw InvalidArgumentException("The document has a root element already.");
  }
}

}  // namespace

void Node::IncRef() const noexcept {
  tree_->IncRef();
}

void Node::DecRef() const noexcept {
  tree_->DecRef();
}

long Node::RefCount() const noexcept {
  return tree_->RefCount();
}

std::string Node::ToString() const {
  switch (kind_) {
    case NodeKind::kElement:
      return "<ElementNode " +
             std::string(static_cast<const ElementNode*>(this)->QualifiedNameText()) + ">";
    case NodeKind::kText:
      return "<TextNode>";
    case NodeKind::kComment:
      return "<CommentNode>";
    case NodeKind::kProcessingInstruction:
      return "<ProcessingInstructionNode>";
    case NodeKind::kDocument:
      break;
  }
  return "<Document>";
}

ElementNode* Node::ParentElement() const noexcept {
  return AsElement(parent_);
}

Node* Node::NextSibling() const noexcept {
  return parent_ == nullptr || parent_->LastChild() == this ? nullptr : next_;
}

Node* ParentNode::FirstChild() const noexcept {
  return last_ == nullptr ? nullptr : last_->next_;
}

ElementNode* ParentNode::FirstChildElement(std::string_view localName) const noexcept {
  for (Node* node = FirstChild(); node != nullptr; node = node->NextSibling()) {
    ElementNode* element = AsElement(node);
    if (element != nullptr && element->LocalName() == localName) {
      return element;
    }
  }
  return nullptr;
}

ElementNode* ParentNode::FirstChildElement(std::string_view namespaceUri,
                                           std::string_view localName) const noexcept {
  for (Node* node = FirstChild(); node != nullptr; node = node->NextSibling()) {
    ElementNode* element = AsElement(node);
    if (element != nullptr && element->LocalName() == localName &&
        element->NamespaceUri() == namespaceUri) {
      return element;
    }
  }
  return nullptr;
}

void ParentNode::AppendChild(Node* child) {
  if (child == nullptr) {
    throw InvalidArgumentException("The child to append is null.");
  }
  if (child->Kind() == NodeKind::kDocument) {
    throw InvalidArgumentException("A document cannot be a child.");
  }
  if (Kind() == NodeKind::kDocument) {
    CheckChildOfDocument(*this, *child);
  }
  // A node without children contains only itself, so leaves need no walk to the root.
  const ElementNode* element = AsElement(child);
  const bool mayHoldThis = element != nullptr && (element->LastChild() != nullptr || child == this);
  for (const Node* node = this; mayHoldThis && node != nullptr; node = node->parent_) {
    if (node == child) {
      throw InvalidArgumentException("Element " + QuoteVerbatim(element->QualifiedNameText()) +
                                     " cannot be placed inside itself.");
    }
  }
  if (child->parent_ != nullptr) {
    child->parent_->RemoveChild(child);
  }
  Tree::Join(*tree_, *child->tree_);
  TreeBuilder::Append(*this, *child);
}

void ParentNode::RemoveChild(Node* child) {
  if (child == nullptr || child->parent_ != this) {
    throw InvalidArgumentException("The node to remove is not a child of this node.");
  }
  Node* previous = last_;
  while (previous->next_ != child) {
    previous = previous->next_;
  }
  previous->next_ = child->next_;
  if (last_ == child) {
    last_ = previous == child ? nullptr : previous;
  }
  child->parent_ = nullptr;
  child->next_ = nullptr;
}

}  // namespace Tarnik::Xml
