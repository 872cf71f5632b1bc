#include "support/fragment.h"

#include <memory>
#include <stdexcept>
#include <string>

#include <tarnik/xml/element_node.h>

#include "support/assertion_text.h"
#include "support/parse_xml.h"
#include "token/child_cursor.h"
#include "token/strict_rules.h"

namespace SsoClient::Testing {

using Tarnik::Xml::ElementNode;

Fragment::Fragment(const std::string& content)
    : document_(ParseXml("<root " + NamespaceDeclarations() + ">" + content + "</root>")),
      cursor_(*document_->RootElement(), std::make_shared<const SkipWsAndCommentsFilter>()) {}

ElementNode& Fragment::Element() const {
  for (Tarnik::Xml::Node* child = Root().FirstChild(); child != nullptr;
       child = child->NextSibling()) {
    if (ElementNode* element = AsElement(child)) {
      return *element;
    }
  }
  throw std::logic_error("The fragment holds no element.");
}

}  // namespace SsoClient::Testing
