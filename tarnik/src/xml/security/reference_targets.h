#ifndef TARNIK_XML_SECURITY_REFERENCE_TARGETS_H
#define TARNIK_XML_SECURITY_REFERENCE_TARGETS_H

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>
#include <vector>

namespace Tarnik::Xml::Security {

/// The node that each reference points at (XML-Signature, section 4.4.3.2): the whole document for
/// an empty URI, else the one element that carries the id behind the number sign. The document is
/// everything below `root`; ids in `signature` count even when it is not part of that yet.
///
/// An id is an attribute "ID", "Id" or "id" without a prefix, xml:id, or wsu:Id. Throws
/// `XmlSecurityException` when a URI has any other form, when no element carries the id, and when
/// another element carries the same value in an attribute that anyone may take for an id, whatever
/// its prefix and letter case.
std::vector<const Node*> FindReferenceTargets(const Node* root, const ElementNode* signature,
                                              const std::vector<Reference>& references);

/// The topmost node that holds `node`.
const Node* RootOf(const Node* node) noexcept;

/// True when `inner` is `outer` or stands in it.
bool IsWithin(const Node* inner, const Node* outer) noexcept;

}  // namespace Tarnik::Xml::Security

#endif
