#ifndef SSOCLIENT_TOKEN_ELEMENT_RULES_H
#define SSOCLIENT_TOKEN_ELEMENT_RULES_H

#include <string_view>

#include <tarnik/xml/element_node.h>

#include "token/child_cursor.h"

namespace SsoClient {

/// `node` as an element; null when it is null or of another kind.
Tarnik::Xml::ElementNode* AsElement(Tarnik::Xml::Node* node) noexcept;

/// `node` as the element of this name and namespace. Throws `ParseException` when it is anything
/// else or null.
Tarnik::Xml::ElementNode& ExpectElement(Tarnik::Xml::Node* node, std::string_view localName,
                                        std::string_view namespaceUri);

/// Throws `ParseException` unless the cursor's element has nothing more to read.
void ExpectEmpty(const ChildCursor& cursor);

/// The text of an element whose only child is text; as long-lived as the tree. Throws
/// `ParseException` for any other content: a comment that splits a value would otherwise let two
/// readers of one signed text see two values.
std::string_view ReadTextContent(const Tarnik::Xml::ElementNode& element);

}  // namespace SsoClient

#endif
