#include "token/element_rules.h"

#include <ssoclient/exceptions.h>
#include <tarnik/xml/character_nodes.h>

#include "token/concat.h"

namespace SsoClient {

Tarnik::Xml::ElementNode* AsElement(Tarnik::Xml::Node* node) noexcept {
  if (node == nullptr || node->Kind() != Tarnik::Xml::NodeKind::kElement) {
    return nullptr;
  }
  return static_cast<Tarnik::Xml::ElementNode*>(node);
}

Tarnik::Xml::ElementNode& ExpectElement(Tarnik::Xml::Node* node, std::string_view localName,
                                        std::string_view namespaceUri) {
  Tarnik::Xml::ElementNode* element = AsElement(node);
  if (element == nullptr || element->LocalName() != localName) {
    throw ParseException(Concat({"Expected element '", localName, "' not found."}));
  }
  if (element->NamespaceUri() != namespaceUri) {
    throw ParseException(
        Concat({"Element '", element->QualifiedNameText(), "' has unexpected namespace"}));
  }
  return *element;
}

void ExpectEmpty(const ChildCursor& cursor) {
  if (!cursor.IsAtEnd()) {
    throw ParseException(
        Concat({"Element '", cursor.Parent().QualifiedNameText(), "' must be empty"}));
  }
}

std::string_view ReadTextContent(const Tarnik::Xml::ElementNode& element) {
  const Tarnik::Xml::Node* child = element.FirstChild();
  if (child == nullptr || child->Kind() != Tarnik::Xml::NodeKind::kText ||
      child->NextSibling() != nullptr) {
    throw ParseException(
        Concat({"Element '", element.QualifiedNameText(),
                "' must only have textual content (but has extra children or is empty)."}));
  }
  return static_cast<const Tarnik::Xml::TextNode*>(child)->Text();
}

}  // namespace SsoClient
