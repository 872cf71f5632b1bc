#ifndef SSOCLIENT_TOKEN_CHILD_CURSOR_H
#define SSOCLIENT_TOKEN_CHILD_CURSOR_H

#include <memory>
#include <string_view>
#include <utility>

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/node.h>

namespace SsoClient {

/// Decides which nodes a reader gets to see. Implementations are safe to share between threads.
class NodeFilter {
 public:
  /// True when the reader is to see `node`, false when it is to skip it.
  virtual bool IsVisible(const Tarnik::Xml::Node& node) const = 0;

 protected:
  ~NodeFilter() = default;
};

/// Hides comments and text of white space alone (XML 1.0, section 2.3: S); shows everything else.
class SkipWsAndCommentsFilter final : public NodeFilter {
 public:
  bool IsVisible(const Tarnik::Xml::Node& node) const override;
};

/// Walks the children of one element in document order, over those that the filter shows.
/// Does not keep the tree alive.
class ChildCursor {
 public:
  /// Stands at the first visible child of `parent`.
  ChildCursor(const Tarnik::Xml::ElementNode& parent, std::shared_ptr<const NodeFilter> filter);

  /// A cursor over the children of `element` that shares this one's filter.
  ChildCursor Into(const Tarnik::Xml::ElementNode& element) const {
    return ChildCursor(element, filter_);
  }

  const Tarnik::Xml::ElementNode& Parent() const noexcept { return *parent_; }
  /// The node that is to be read next; null at the end.
  Tarnik::Xml::Node* Current() const noexcept { return current_; }
  bool IsAtEnd() const noexcept { return current_ == nullptr; }
  /// True when the current node is an element of this local name, whatever its namespace.
  bool IsAtElement(std::string_view localName) const noexcept;
  /// Steps to the next visible child. Not to be called at the end.
  void Advance();

 private:
  void SkipHidden();

  const Tarnik::Xml::ElementNode* parent_;
  std::shared_ptr<const NodeFilter> filter_;
  Tarnik::Xml::Node* current_;
};

}  // namespace SsoClient

#endif
