#ifndef TARNIK_XML_SECURITY_CANONICALIZER_H
#define TARNIK_XML_SECURITY_CANONICALIZER_H

#include <string>
#include <string_view>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/core/writer.h>
#include <tarnik/xml/node.h>

namespace Tarnik::Xml::Security {

/// Writes the canonical form of a subtree. Stateless between calls; thread-safe.
class TARNIK_EXPORT Canonicalizer : public virtual Object {
 public:
  /// Writes the canonical form of `node` (a document, or an element with all its content) to
  /// `writer`. An element inside a document is treated as a subset of the document: its output has
  /// the namespace context, and with inclusive canonicalisation the xml: attributes, that it
  /// inherits. Throws `XmlSecurityException` when a namespace in scope is a relative URI (Canonical
  /// XML 1.0, section 1.3).
  virtual void Canonicalize(const Node* node, Writer* writer) const = 0;
};

/// The canonicalizer of an algorithm URI, which is compared as a whole:
///  - Canonical XML 1.0: "http://www.w3.org/TR/2001/REC-xml-c14n-20010315", also with "#" at its
///    end, and "...#WithComments";
///  - Exclusive XML Canonicalization 1.0: "http://www.w3.org/2001/10/xml-exc-c14n#" and
///    "...#WithComments".
/// `inclusivePrefixes` is the PrefixList of the exclusive method's InclusiveNamespaces ("#default"
/// names the default namespace). Throws `XmlSecurityException` for any other URI, and for prefixes
/// given to an inclusive method.
TARNIK_EXPORT Ref<Canonicalizer> CreateCanonicalizer(
    std::string_view algorithm, const std::vector<std::string>& inclusivePrefixes = {});

}  // namespace Tarnik::Xml::Security

#endif
