#ifndef SSOCLIENT_SUPPORT_QNAME_H
#define SSOCLIENT_SUPPORT_QNAME_H

#include <string>
#include <string_view>

#include <tarnik/xml/element_node.h>

namespace SsoClient {

/// An expanded name (Namespaces in XML 1.0, section 2.1).
struct QName {
  std::string namespaceUri;
  std::string localName;

  friend bool operator==(const QName&, const QName&) = default;
};

/// The same as views into the tree and the name that it was made from.
struct QNameView {
  std::string_view namespaceUri;
  std::string_view localName;

  friend bool operator==(const QNameView&, const QNameView&) = default;
};

/// Resolves a qualified name by the namespaces in scope at `context`. A name without a colon is in
/// `defaultNamespace`. The prefix ends at the first colon. Throws `ParseException` for an
/// undeclared prefix.
QNameView ResolveQNameView(const Tarnik::Xml::ElementNode& context, std::string_view name,
                           std::string_view defaultNamespace);

/// As above, for a name in the text of `context`: white space around it is not part of it (XML
/// Schema Part 2, sections 3.2.18 and 4.3.6).
QName ResolveQName(const Tarnik::Xml::ElementNode& context, std::string_view name,
                   std::string_view defaultNamespace);

/// Resolves a QName that is the value of an attribute of `context`, such as xsi:type. White space
/// around it is not part of it, and without a prefix it is in the default namespace in scope (XML
/// Schema Part 2, section 3.2.18). Throws as above.
QNameView ResolveQNameValue(const Tarnik::Xml::ElementNode& context, std::string_view value);

}  // namespace SsoClient

#endif
