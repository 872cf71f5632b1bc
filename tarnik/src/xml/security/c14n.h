#ifndef TARNIK_XML_SECURITY_C14N_H
#define TARNIK_XML_SECURITY_C14N_H

#include <string>
#include <string_view>
#include <vector>

#include <tarnik/core/writer.h>
#include <tarnik/xml/element_node.h>

namespace Tarnik::Xml::Security {

struct C14nOptions {
  bool exclusive = false;
  bool withComments = false;
  /// The PrefixList of InclusiveNamespaces (Exclusive XML Canonicalization 1.0, section 3);
  /// "#default" is the default namespace. Only for the exclusive method.
  std::vector<std::string> inclusivePrefixes;
};

/// Sets `options` for the algorithm URI; false when the URI is not a supported canonicalisation.
bool ReadC14nAlgorithm(std::string_view algorithm, C14nOptions& options) noexcept;

/// Writes the canonical form of `node`, a document or an element with all its content, without the
/// element `omitted` (null for nothing), as the enveloped-signature transform requires. Throws
/// `XmlSecurityException` for a relative namespace URI in scope, and with the exclusive method for
/// an unbound prefix. The output is incomplete after a failure.
void WriteCanonical(const Node* node, const ElementNode* omitted, const C14nOptions& options,
                    Writer& writer);

}  // namespace Tarnik::Xml::Security

#endif
