#ifndef TARNIK_XML_ELEMENT_NODE_H
#define TARNIK_XML_ELEMENT_NODE_H

#include <cstddef>
#include <optional>
#include <string_view>

#include <tarnik/xml/node.h>

namespace Tarnik::Xml {

struct InternedName;

/// A qualified name: "prefix:local", or "local" with an empty prefix.
class QualifiedName {
 public:
  QualifiedName() = default;
  /// The name `full`, whose first `prefixLength` bytes are the prefix. Keeps a view, not a copy.
  QualifiedName(std::string_view full, std::size_t prefixLength) noexcept
      : full_(full), prefixLength_(prefixLength) {}

  /// The name as written.
  std::string_view Full() const noexcept { return full_; }
  /// What precedes the colon; empty without one.
  std::string_view Prefix() const noexcept { return full_.substr(0, prefixLength_); }
  /// What follows the colon; without one, the whole name.
  std::string_view Local() const noexcept {
    return prefixLength_ == 0 ? full_ : full_.substr(prefixLength_ + 1);
  }

 private:
  std::string_view full_;
  std::size_t prefixLength_ = 0;
};

/// An attribute. Namespace declarations are attributes named "xmlns" or "xmlns:p".
class TARNIK_EXPORT Attribute {
 public:
  /// The qualified name as written.
  std::string_view Name() const noexcept { return Qualified().Full(); }
  /// The qualified name with its parts.
  QualifiedName Qualified() const noexcept;
  /// The value, normalised and unescaped, in UTF-8.
  std::string_view Value() const noexcept { return {value_, valueLength_}; }
  /// True for "xmlns" and "xmlns:p".
  bool IsNamespaceDeclaration() const noexcept;

 private:
  friend class ElementNode;
  friend class TreeBuilder;
  const InternedName* name_;
  const char* value_;
  unsigned valueLength_;
};

/// An element. Its attributes keep the order in which they were written or set; namespace
/// declarations are ordinary attributes among them.
class TARNIK_EXPORT ElementNode final : public ParentNode {
 public:
  /// The name as written, with its prefix.
  std::string_view QualifiedNameText() const noexcept;
  /// The prefix as written; empty without one.
  std::string_view Prefix() const noexcept;
  /// The name without its prefix.
  std::string_view LocalName() const noexcept;
  /// The namespace bound to the element's prefix here; empty when the prefix is not bound.
  std::string_view NamespaceUri() const noexcept;

  /// The namespace that is bound to `prefix` at this element (Namespaces in XML 1.0, section 6);
  /// the empty prefix means the default namespace. Nothing when the prefix is not bound; an empty
  /// string when the default namespace is undeclared with xmlns="". "xml" is always bound.
  std::optional<std::string_view> LookupNamespace(std::string_view prefix) const noexcept;

  /// The next element in document order (XML Path Language 1.0, section 5) inside `top`: the first
  /// one in this element or else the next one after it; null after the last one. `top` is this
  /// element or one that contains it, or null for the whole tree. Works without recursion, however
  /// deep the tree is.
  ElementNode* NextElement(const ElementNode* top) const noexcept;

  /// The number of attributes, namespace declarations included.
  std::size_t AttributeCount() const noexcept;
  /// Attribute `index`, from 0.
  const Attribute& AttributeAt(std::size_t index) const noexcept;
  /// The value of the attribute with this qualified name, or nothing.
  std::optional<std::string_view> FindAttribute(std::string_view qualifiedName) const noexcept;
  /// The value of the attribute with this expanded name, or nothing; the empty namespace finds
  /// attributes without a prefix.
  std::optional<std::string_view> FindAttribute(std::string_view namespaceUri,
                                                std::string_view localName) const noexcept;

  /// Sets an attribute by its qualified name: a new one is added last, an existing one keeps its
  /// position. Throws `InvalidArgumentException` when the name is not a qualified name, as
  /// `CreateElementNode` defines it, or the value contains what XML 1.0 does not allow
  /// (section 2.2: control characters, invalid UTF-8, U+FFFE, U+FFFF).
  void SetAttribute(std::string_view qualifiedName, std::string_view value);
  /// Removes the attribute; false if the element does not have it.
  bool RemoveAttribute(std::string_view qualifiedName) noexcept;

 private:
  friend class Tree;
  friend class TreeBuilder;
  ElementNode(Tree& tree, const InternedName* name) noexcept
      : ParentNode(tree, NodeKind::kElement),
        name_(name),
        attributeCapacity_(0),
        declaresNamespaces_(0) {}

  Attribute* FindQualified(std::string_view qualifiedName) const noexcept;
  void AddAttribute(const Attribute& attribute);

  const InternedName* name_;
  Attribute* attributes_ = nullptr;
  unsigned attributeCount_ = 0;
  unsigned attributeCapacity_ : 31;
  unsigned declaresNamespaces_ : 1;  // may stay set when the last declaration is removed
};

/// Creates an element without attributes or children. An empty prefix gives an unprefixed name.
/// Throws `InvalidArgumentException` unless prefix and local name are NCNames (Namespaces in
/// XML 1.0, section 3) with the letters, digits and other characters of XML 1.0, fourth edition,
/// appendix B. The parser reads the same names; the further characters of the fifth edition are
/// refused.
TARNIK_EXPORT void CreateElementNode(std::string_view prefix, std::string_view localName,
                                     Ref<ElementNode>& element);

}  // namespace Tarnik::Xml

#endif
