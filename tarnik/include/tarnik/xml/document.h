#ifndef TARNIK_XML_DOCUMENT_H
#define TARNIK_XML_DOCUMENT_H

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/node.h>

namespace Tarnik::Xml {

/// A parsed document: its root element, and the comments and processing instructions around it.
class TARNIK_EXPORT Document final : public ParentNode {
 public:
  /// The root element; a parsed document always has one.
  ElementNode* RootElement() const noexcept;

 private:
  friend class Tree;
  friend class TreeBuilder;
  using ParentNode::ParentNode;
};

}  // namespace Tarnik::Xml

#endif
