#include "token/child_cursor.h"

#include <tarnik/xml/character_nodes.h>

#include "token/strict_rules.h"

namespace SsoClient {

bool SkipWsAndCommentsFilter::IsVisible(const Tarnik::Xml::Node& node) const {
  if (node.Kind() == Tarnik::Xml::NodeKind::kComment) {
    return false;
  }
  if (node.Kind() != Tarnik::Xml::NodeKind::kText) {
    return true;
  }
  const std::string_view text = static_cast<const Tarnik::Xml::TextNode&>(node).Text();
  return text.find_first_not_of("\t\n\r ") != std::string_view::npos;
}

ChildCursor::ChildCursor(const Tarnik::Xml::ElementNode& parent,
                         std::shared_ptr<const NodeFilter> filter)
    : parent_(&parent), filter_(std::move(filter)), current_(parent.FirstChild()) {
  SkipHidden();
}

bool ChildCursor::IsAtElement(std::string_view localName) const noexcept {
  const Tarnik::Xml::ElementNode* element = AsElement(current_);
  return element != nullptr && element->LocalName() == localName;
}

void ChildCursor::Advance() {
  current_ = current_->NextSibling();
  SkipHidden();
}

void ChildCursor::SkipHidden() {
  while (current_ != nullptr && !filter_->IsVisible(*current_)) {
    current_ = current_->NextSibling();
  }
}

}  // namespace SsoClient
