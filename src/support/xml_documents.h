#ifndef SSOCLIENT_SUPPORT_XML_DOCUMENTS_H
#define SSOCLIENT_SUPPORT_XML_DOCUMENTS_H

#include <initializer_list>
#include <string>
#include <string_view>

#include <tarnik/core/reader.h>
#include <tarnik/core/ref.h>
#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>

namespace SsoClient {

/// Parses the document that `reader` or `text` contains. Throws `Tarnik::Xml::XMLParseException`.
Tarnik::Ref<Tarnik::Xml::Document> ParseDocument(Tarnik::Reader* reader);
Tarnik::Ref<Tarnik::Xml::Document> ParseDocument(const std::string& text);

/// Returns the first child of `element` if that is a text node. Returns null otherwise, and when
/// `element` is null.
const Tarnik::Xml::TextNode* FirstTextChild(const Tarnik::Xml::ElementNode* element);

/// Returns the text of `FirstTextChild`, empty when that is null; valid as long as the document.
std::string_view ElementText(const Tarnik::Xml::ElementNode* element);

/// Follows `path` down from `element`, at each step to the first child element of that local name.
/// Returns null when one is missing.
const Tarnik::Xml::ElementNode* FindDescendant(const Tarnik::Xml::ElementNode& element,
                                               std::initializer_list<std::string_view> path);

/// Returns the element in Canonical XML 1.0, so with the namespace declarations that it inherits.
/// Returns an empty string when `element` is null.
std::string CanonicalizeElement(const Tarnik::Xml::ElementNode* element);

}  // namespace SsoClient

#endif
