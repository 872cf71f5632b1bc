#ifndef TARNIK_XML_SECURITY_REFERENCE_TARGETS_H
#define TARNIK_XML_SECURITY_REFERENCE_TARGETS_H

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>
#include <vector>

namespace Tarnik::Xml::Security {

/// The node that each reference points at (XML-Signature, section 4.4.3.2): the whole document for
/// an empty URI, else the one element that carries the id behind the number sign.
///
/// An id is an attribute "ID", "Id" or "id" without a prefix, xml:id, or wsu:Id. Throws
/// `XmlSecurityException` when a URI has any other form, when no element carries the id, and when
/// another element carries the same value in an attribute that anyone may take for an id, whatever
/// its prefix and letter case.
std::vector<const Node*> FindReferenceTargets(const ElementNode* signature,
                                              const std::vector<Reference>& references);

/// True when `inner` is `outer` or stands in it.
bool IsWithin(const Node* inner, const Node* outer) noexcept;

}  // namespace Tarnik::Xml::Security

#endif
