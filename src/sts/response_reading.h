#ifndef SSOCLIENT_STS_RESPONSE_READING_H
#define SSOCLIENT_STS_RESPONSE_READING_H

#include <initializer_list>
#include <string>
#include <string_view>

#include <tarnik/xml/character_nodes.h>
#include <tarnik/xml/element_node.h>

namespace SsoClient {

/// The first child of `element` if that is a text node; null otherwise, also for no element.
const Tarnik::Xml::TextNode* FirstTextChild(const Tarnik::Xml::ElementNode* element);

/// The text of `FirstTextChild`, empty when there is none. Lives as long as the document.
std::string_view ElementText(const Tarnik::Xml::ElementNode* element);

/// Follows `path` down from `element`, at each step to the first child element of that local name;
/// null when one is missing.
const Tarnik::Xml::ElementNode* FindDescendant(const Tarnik::Xml::ElementNode& element,
                                               std::initializer_list<std::string_view> path);

/// The element's text in Canonical XML 1.0, so with the namespace declarations that it inherits;
/// empty for no element.
std::string CanonicalizeElement(const Tarnik::Xml::ElementNode* element);

/// Returns quietly unless the envelope's body holds a fault (SOAP 1.1, section 4.4). Throws
/// `PasswordExpiredException` or `InvalidCredentialsException` for the fault codes that mean so
/// (WS-Trust 1.3, section 11; Web Services Security: SOAP Message Security 1.0, section 12),
/// `SsoException` for any other, and `ParseException` for a code with an unbound prefix.
void CheckSoapFault(const Tarnik::Xml::ElementNode& envelope);

}  // namespace SsoClient

#endif
