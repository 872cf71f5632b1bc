#ifndef TARNIK_XML_SECURITY_ALGORITHM_LIST_H
#define TARNIK_XML_SECURITY_ALGORITHM_LIST_H

#include <tarnik/xml/element_node.h>
#include <string>
#include <string_view>
#include <vector>

#include "crypto/algorithms.h"
#include "xml/security/c14n.h"

/// The algorithms that signatures are verified with: a closed list, compared as whole URIs. Every
/// function throws `XmlSecurityException` for what is not on it, and for parameters that the
/// algorithm does not take.
namespace Tarnik::Xml::Security {

struct SignatureMethod {
  Crypto::SignatureScheme scheme;
  Crypto::Hash hash;
};

/// RSA with PKCS#1 v1.5 padding (RFC 6931, section 2.3.2 and on), RSA-PSS with the defaults of RFC
/// 6931, section 2.3.10, and ECDSA (section 2.3.6), each with SHA-256, SHA-384 and SHA-512.
SignatureMethod RequireSignatureMethod(std::string_view algorithm, const ElementNode* element);

/// SHA-256, SHA-384 and SHA-512 (XML Encryption, section 5.7; RFC 6931, section 2.1.3).
Crypto::Hash RequireDigestMethod(std::string_view algorithm, const ElementNode* element);

/// Canonical XML 1.0 and Exclusive XML Canonicalization 1.0, with and without comments.
C14nOptions RequireCanonicalizationMethod(std::string_view algorithm, const ElementNode* element);

/// What a reference's transforms come to.
struct TransformPlan {
  bool enveloped = false;
  C14nOptions canonicalization;
};

/// Accepts enveloped-signature and then one canonicalisation, either of them left out. Without a
/// canonicalisation it is Canonical XML 1.0 (XML-Signature, section 4.4.3.2).
TransformPlan RequireTransforms(const std::vector<std::string>& algorithms,
                                const std::vector<const ElementNode*>& elements);

}  // namespace Tarnik::Xml::Security

#endif
