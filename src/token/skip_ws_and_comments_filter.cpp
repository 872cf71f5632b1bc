#include "token/skip_ws_and_comments_filter.h"

#include <tarnik/xml/character_nodes.h>

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

}  // namespace SsoClient
