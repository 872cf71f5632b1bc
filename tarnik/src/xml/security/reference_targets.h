#ifndef TARNIK_XML_SECURITY_REFERENCE_TARGETS_H
#define TARNIK_XML_SECURITY_REFERENCE_TARGETS_H

#include <vector>

#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/signature.h>

namespace Tarnik::Xml::Security {

/// The target of each reference (XML Signature 1.1, section 4.4.3.3): the whole document for an
/// empty URI, else the only element with the id after the number sign. The document is the tree of
/// `root`; ids in `signature` count even when it is not part of that tree yet.
///
/// An id is an attribute "ID", "Id" or "id" without a prefix, xml:id, or wsu:Id. Throws
/// `XmlSecurityException` when a URI has another form, when no element has the id, and when another
/// element has the same `PossibleId`.
std::vector<const Node*> FindReferenceTargets(const Node* root, const ElementNode* signature,
                                              const std::vector<Reference>& references);

/// The topmost node that contains `node`.
const Node* RootOf(const Node* node) noexcept;

/// True when `inner` is `outer` or is in it.
bool IsWithin(const Node* inner, const Node* outer) noexcept;

}  // namespace Tarnik::Xml::Security

#endif
