#ifndef TARNIK_XML_SECURITY_ALGORITHMS_H
#define TARNIK_XML_SECURITY_ALGORITHMS_H

#include <optional>
#include <string>
#include <string_view>
#include <vector>

#include <tarnik/xml/element_node.h>

#include "crypto/hash.h"
#include "crypto/signature_scheme.h"
#include "xml/security/c14n.h"

/// The supported algorithms of signatures: a closed list, compared as whole URIs. Every function
/// throws `XmlSecurityException` for an algorithm that is not on the list, and for parameters that
/// the algorithm does not take.
namespace Tarnik::Xml::Security {

struct SignatureMethod {
  Crypto::SignatureScheme scheme;
  Crypto::Hash hash;
};

/// RSA with PKCS#1 v1.5 padding (RFC 6931, section 2.3.2 and on), RSA-PSS with the defaults of RFC
/// 6931, section 2.3.10, and ECDSA (section 2.3.6), each with SHA-256, SHA-384 and SHA-512.
SignatureMethod LookUpSignatureMethod(std::string_view algorithm, const ElementNode* element);

/// SHA-256, SHA-384 and SHA-512 (XML Encryption, section 5.7; RFC 6931, section 2.1.3).
Crypto::Hash LookUpDigestMethod(std::string_view algorithm, const ElementNode* element);

/// The same, but nothing for an algorithm that is not on the list.
std::optional<Crypto::Hash> FindDigestMethod(std::string_view algorithm) noexcept;

/// Canonical XML 1.0 and Exclusive XML Canonicalization 1.0, with and without comments.
C14nOptions LookUpCanonicalizationMethod(std::string_view algorithm, const ElementNode* element);

/// The combined effect of a reference's transforms.
struct TransformPlan {
  bool enveloped = false;
  C14nOptions canonicalization;
};

/// Accepts enveloped-signature and then one canonicalisation, both optional. Without a
/// canonicalisation the reference uses Canonical XML 1.0 (XML Signature 1.1, section 4.4.3.2).
/// enveloped-signature may have one InclusiveNamespaces element, which has no effect there.
TransformPlan PlanTransforms(const std::vector<std::string>& algorithms,
                             const std::vector<const ElementNode*>& elements);

}  // namespace Tarnik::Xml::Security

#endif
