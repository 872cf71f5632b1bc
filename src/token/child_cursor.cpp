#include "token/child_cursor.h"

#include "token/element_rules.h"

namespace SsoClient {

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
