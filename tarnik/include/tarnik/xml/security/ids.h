#ifndef TARNIK_XML_SECURITY_IDS_H
#define TARNIK_XML_SECURITY_IDS_H

#include <optional>
#include <string_view>

#include <tarnik/xml/element_node.h>

namespace Tarnik::Xml::Security {

/// The value of an attribute that some software may take for the id of its element, without the
/// white space around it; nothing for any other attribute. Receivers differ in which attributes are
/// ids (xml:id 1.0; Web Services Security: SOAP Message Security 1.0, section 4.1; SAML 2.0 core,
/// section 1.3.4) and in how they compare them. So every attribute counts whose local name is "id"
/// in any letter case, whatever its prefix, and the AssertionID of SAML 1.1 (core, section 2.3.2).
/// The letter case of the value matters.
///
/// If two elements have the same value here, two receivers of one text may find different elements.
/// `Signature::Verify` and `Sign` refuse references to such a value.
///
/// The view is valid as long as the attribute. Thread-safe while the tree is not changed.
TARNIK_EXPORT std::optional<std::string_view> PossibleId(const Attribute& attribute) noexcept;

}  // namespace Tarnik::Xml::Security

#endif
