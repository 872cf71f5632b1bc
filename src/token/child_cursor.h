#ifndef SSOCLIENT_TOKEN_CHILD_CURSOR_H
#define SSOCLIENT_TOKEN_CHILD_CURSOR_H

#include <memory>
#include <string_view>

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/node.h>

namespace SsoClient {

/// Decides which nodes a reader sees. Implementations are safe to share between threads.
class NodeFilter {
 public:
  /// Returns true when the reader is to see `node`, false when it is to skip it.
  virtual bool IsVisible(const Tarnik::Xml::Node& node) const = 0;

 protected:
  ~NodeFilter() = default;
};

/// Hides comments and text that is only white space (XML 1.0, section 2.3: S); shows everything
/// else.
class SkipWsAndCommentsFilter final : public NodeFilter {
 public:
  bool IsVisible(const Tarnik::Xml::Node& node) const override;
};

/// Returns `node` as an element, or null when it is null or of another kind.
Tarnik::Xml::ElementNode* AsElement(Tarnik::Xml::Node* node) noexcept;

/// Returns `node` as the element of this name and namespace. Throws `ParseException` when it is
/// null or anything else.
Tarnik::Xml::ElementNode& ExpectElement(Tarnik::Xml::Node* node, std::string_view localName,
                                        std::string_view namespaceUri);

/// Walks the children of one element in document order, over those that the filter shows.
/// Does not keep the tree alive.
class ChildCursor {
 public:
  /// Starts at the first visible child of `parent`.
  ChildCursor(const Tarnik::Xml::ElementNode& parent, std::shared_ptr<const NodeFilter> filter);

  /// A cursor over the children of `element` that shares this cursor's filter.
  ChildCursor Into(const Tarnik::Xml::ElementNode& element) const {
    return ChildCursor(element, filter_);
  }

  const Tarnik::Xml::ElementNode& Parent() const noexcept { return *parent_; }
  /// The next node to read; null at the end.
  Tarnik::Xml::Node* Current() const noexcept { return current_; }
  bool IsAtEnd() const noexcept { return current_ == nullptr; }
  /// Returns true when the current node is an element of this local name, in any namespace.
  bool IsAtElement(std::string_view localName) const noexcept;
  /// Returns the current node as the element of this name and namespace and advances past it.
  /// Throws as `ExpectElement` does, and then stays where it is.
  const Tarnik::Xml::ElementNode& TakeElement(std::string_view localName,
                                              std::string_view namespaceUri);
  /// Moves to the next visible child. Must not be called at the end.
  void Advance();
  /// Throws `ParseException` with `message` unless every visible child has been read.
  void ExpectEnd(const char* message) const;

 private:
  void SkipHidden();

  const Tarnik::Xml::ElementNode* parent_;
  std::shared_ptr<const NodeFilter> filter_;
  Tarnik::Xml::Node* current_;
};

}  // namespace SsoClient

#endif
