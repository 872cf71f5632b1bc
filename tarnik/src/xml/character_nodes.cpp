#include <tarnik/core/exception.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/element_node.h>

#include "support/quote.h"
#include "xml/tree_builder.h"
#include "xml/xml_chars.h"

namespace Tarnik::Xml {

void TextNode::SetText(std::string_view text) {
  if (!IsXmlText(text)) {
    const ElementNode* parent = ParentElement();
    const std::string place =
        parent == nullptr ? "" : " of element " + QuoteVerbatim(parent->QualifiedNameText());
    throw InvalidArgumentException("The text" + place +
                                   " holds what XML cannot carry: a control character or bytes "
                                   "that are not UTF-8.");
  }
  const std::string_view stored = tree_->Store(text);
  text_ = stored.data();
  length_ = stored.size();
  hasCDataSection_ = 0;
}

void CreateTextNode(Ref<TextNode>& text) {
  const Tree::Holder tree = Tree::Create(Tree::kNodeBlockBytes);
  text = TreeBuilder::NewText(*tree, "");
}

}  // namespace Tarnik::Xml
