#ifndef TARNIK_XML_NODE_H
#define TARNIK_XML_NODE_H

#include <cstddef>
#include <string>
#include <string_view>

#include <tarnik/core/object.h>
#include <tarnik/core/ref.h>

namespace Tarnik::Xml {

class ElementNode;
class ParentNode;
class Tree;

/// What a node is, which decides its class.
enum class NodeKind : unsigned char {
  kElement,                ///< `ElementNode`
  kText,                   ///< `TextNode`
  kComment,                ///< `CommentNode`
  kProcessingInstruction,  ///< `ProcessingInstructionNode`
  kDocument                ///< `Document`
};

/// A node of the document tree.
///
/// A reference to any node keeps its whole tree alive, and appending a node joins its tree with the
/// tree of its new parent. Therefore parents, children and the views that accessors return are
/// valid as long as any node of the tree is referenced (and a value only until it is set again). A
/// tree may be read from many threads at once as long as nobody modifies it. The memory of a tree
/// is cleansed before it is freed, since requests contain passwords and answers contain tokens.
class TARNIK_EXPORT Node : public Object {
 public:
  void IncRef() const noexcept final;
  void DecRef() const noexcept final;
  long RefCount() const noexcept final;
  /// The kind and, for elements, the name; never content.
  std::string ToString() const override;

  /// What this node is.
  NodeKind Kind() const noexcept { return kind_; }
  /// The element or document that contains this node, or null.
  ParentNode* Parent() const noexcept { return parent_; }
  /// The element that contains this node, or null (also for the root element of a document).
  ElementNode* ParentElement() const noexcept;
  /// The next child of the same parent, or null.
  Node* NextSibling() const noexcept;
  /// The line of its beginning in the source document, counted from 1 (columns in bytes); 0 for
  /// nodes that were not parsed.
  int Line() const noexcept { return static_cast<int>(line_); }
  /// The column of the same position.
  int Column() const noexcept { return static_cast<int>(column_); }

 protected:
  /// For the library: a node of this tree.
  Node(Tree& tree, NodeKind kind) noexcept
      : tree_(&tree), column_(0), hasCDataSection_(0), kind_(kind) {}
  ~Node() override = default;

 private:
  friend class ParentNode;
  friend class TextNode;
  friend class ElementNode;
  friend class Tree;
  friend class TreeBuilder;

  Tree* tree_;
  ParentNode* parent_ = nullptr;
  Node* next_ = nullptr;  // circular: the last child points to the first
  unsigned line_ = 0;
  unsigned column_ : 23;
  unsigned hasCDataSection_ : 1;  // used by text nodes
  NodeKind kind_;
};

/// A node that has children: an element or a document.
class TARNIK_EXPORT ParentNode : public Node {
 public:
  /// The first child, or null.
  Node* FirstChild() const noexcept;
  /// The last child, or null.
  Node* LastChild() const noexcept { return last_; }
  /// The first child element with this local name in any namespace, or null.
  ElementNode* FirstChildElement(std::string_view localName) const noexcept;
  /// The first child element with this expanded name, or null.
  ElementNode* FirstChildElement(std::string_view namespaceUri,
                                 std::string_view localName) const noexcept;

  /// Makes `child` the last child and removes it from its previous parent. Throws
  /// `InvalidArgumentException` when `child` is null, a document, this node, or a node that
  /// contains it, and when this node is a document and `child` is a text or a second root element.
  void AppendChild(Node* child);
  /// Removes `child`, which stays in the memory of this tree without a parent. Throws
  /// `InvalidArgumentException` when it is not a child of this node.
  void RemoveChild(Node* child);

 protected:
  using Node::Node;

 private:
  friend class TreeBuilder;
  Node* last_ = nullptr;
};

}  // namespace Tarnik::Xml

#endif
