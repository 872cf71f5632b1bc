#ifndef TARNIK_XML_TREE_BUILDER_H
#define TARNIK_XML_TREE_BUILDER_H

#include <algorithm>
#include <new>
#include <string_view>

#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_parser.h>

#include "xml/tree.h"

namespace Tarnik::Xml {

/// Creates nodes in a tree without the checks of the public interface, and gives the code of this
/// folder direct access to names and attributes.
class TreeBuilder {
 public:
  static Document* NewDocument(Tree& tree) {
    return new (tree.Allocate<Document>()) Document(tree, NodeKind::kDocument);
  }

  static ElementNode* NewElement(Tree& tree, const InternedName* name) {
    return new (tree.Allocate<ElementNode>()) ElementNode(tree, name);
  }

  static TextNode* NewText(Tree& tree, std::string_view text) {
    const std::string_view stored = tree.Store(text);
    auto* node = new (tree.Allocate<TextNode>()) TextNode(tree, NodeKind::kText);
    node->text_ = stored.data();
    node->length_ = stored.size();
    return node;
  }

  static void MarkCDataSection(TextNode& text) noexcept { text.hasCDataSection_ = 1; }

  static CommentNode* NewComment(Tree& tree, std::string_view text) {
    auto* node = new (tree.Allocate<CommentNode>()) CommentNode(tree, NodeKind::kComment);
    const std::string_view stored = tree.Store(text);
    node->text_ = stored.data();
    node->length_ = stored.size();
    return node;
  }

  static ProcessingInstructionNode* NewProcessingInstruction(Tree& tree, std::string_view target,
                                                             std::string_view text) {
    auto* node = new (tree.Allocate<ProcessingInstructionNode>())
        ProcessingInstructionNode(tree, NodeKind::kProcessingInstruction);
    const std::string_view storedTarget = tree.Store(target);
    node->target_ = storedTarget.data();
    node->targetLength_ = storedTarget.size();
    const std::string_view storedText = tree.Store(text);
    node->text_ = storedText.data();
    node->length_ = storedText.size();
    return node;
  }

  /// Allocates memory for `count` attributes of `element`, which `PutAttribute` fills in order.
  static void ReserveAttributes(ElementNode& element, Tree& tree, std::size_t count) {
    element.attributes_ = tree.Allocate<Attribute>(count);
    element.attributeCapacity_ = static_cast<unsigned>(count);
  }

  /// `value` is not copied and must be stored in the tree.
  static void PutAttribute(ElementNode& element, const InternedName* name, std::string_view value) {
    auto* attribute = new (element.attributes_ + element.attributeCount_) Attribute;
    *attribute = MakeAttribute(name, value);
    ++element.attributeCount_;
    element.declaresNamespaces_ |= name->isDeclaration ? 1U : 0U;
  }

  static Attribute MakeAttribute(const InternedName* name, std::string_view value) noexcept {
    Attribute attribute;
    attribute.name_ = name;
    attribute.value_ = value.data();
    attribute.valueLength_ = static_cast<unsigned>(value.size());
    return attribute;
  }

  /// `child` must be in the tree of `parent` and have no parent.
  static void Append(ParentNode& parent, Node& child) noexcept {
    child.parent_ = &parent;
    child.next_ = &child;
    if (parent.last_ != nullptr) {
      child.next_ = parent.last_->next_;
      parent.last_->next_ = &child;
    }
    parent.last_ = &child;
  }

  static void SetPosition(Node& node, const Position& position) noexcept {
    constexpr unsigned long kMaxColumn = (1UL << 23) - 1;
    node.line_ = static_cast<unsigned>(position.line);
    node.column_ = static_cast<unsigned>(std::min(position.column, kMaxColumn)) & 0x7FFFFFU;
  }

  static const InternedName& NameOf(const ElementNode& element) noexcept { return *element.name_; }
  static const InternedName& NameOf(const Attribute& attribute) noexcept {
    return *attribute.name_;
  }
  static const Attribute* AttributesOf(const ElementNode& element) noexcept {
    return element.attributes_;
  }
  static std::size_t AttributeCountOf(const ElementNode& element) noexcept {
    return element.attributeCount_;
  }
  static bool DeclaresNamespaces(const ElementNode& element) noexcept {
    return element.declaresNamespaces_ != 0;
  }
};

}  // namespace Tarnik::Xml

#endif
