#ifndef TARNIK_XML_SECURITY_SIGNATURE_H
#define TARNIK_XML_SECURITY_SIGNATURE_H

#include <string>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/key_info.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace Tarnik::Xml::Security {

/// One ds:Reference (XML-Signature, section 4.3.3).
struct Reference {
  std::string uri;  ///< as written; empty for the whole document
  std::string digestMethod;
  std::vector<std::string> transforms;  ///< algorithm URIs, in order
  std::vector<unsigned char> digestValue;
};

/// An XML signature (XML-Signature Syntax and Processing, W3C) and the tree that it stands in.
/// Immutable; safe from many threads, as long as nobody changes the tree.
class TARNIK_EXPORT Signature : public virtual Object {
 public:
  virtual const std::string& CanonicalizationMethod() const = 0;
  virtual const std::string& SignatureMethod() const = 0;
  virtual const std::vector<Reference>& References() const = 0;
  virtual const Security::KeyInfo& KeyInfo() const = 0;
  /// The ds:Signature element.
  virtual ElementNode* Element() const = 0;

  /// Verifies the signature value over SignedInfo with the key that `resolver` gives, and then the
  /// digest of every reference. False when either does not match. Nothing is computed before all
  /// algorithms and references were judged, and nothing is ever fetched.
  ///
  /// The algorithms are a closed list, compared as whole URIs:
  ///  - signatures: RSA PKCS#1 v1.5, RSA-PSS (RFC 6931, section 2.3.10) and ECDSA on P-256, P-384
  ///    and P-521, each with SHA-256, SHA-384 or SHA-512; RSA keys of at least 2048 bits;
  ///  - digests: SHA-256, SHA-384 and SHA-512;
  ///  - canonicalisations: those of `CreateCanonicalizer`;
  ///  - transforms: enveloped-signature and then one canonicalisation, either of them left out.
  ///
  /// A reference is empty (the whole document) or "#" followed by the id of exactly one element of
  /// the document: an attribute "ID", "Id" or "id", xml:id, or wsu:Id. No second element may carry
  /// that value in any attribute that could be taken for an id. What a reference covers must
  /// either enclose the signature and have the enveloped-signature transform, or stand outside of
  /// it and not have it.
  ///
  /// Throws `XmlSecurityException` when the signature cannot be judged: `resolver` is null, an
  /// algorithm is not on the list, a reference is not as above, there is no trusted key or it does
  /// not fit the algorithm or is too weak, a namespace cannot be canonicalised, or the
  /// cryptographic library fails. What the resolver throws passes through unchanged.
  virtual bool Verify(const KeyInfoResolver* resolver) const = 0;
};

/// Reads `element` as a ds:Signature of its document, in the order of the schema. Throws
/// `SignatureSyntaxException` when it breaks the structure of XML-Signature; algorithms and values
/// are judged by `Verify`. Also refused, though the schema allows them: ds:Object, a reference
/// without a URI, more than 16 references, RetrievalMethod, and comments or processing instructions
/// inside values. Throws `InvalidArgumentException` when `element` is null.
TARNIK_EXPORT Ref<Signature> CreateSignatureFromDom(ElementNode* element);

}  // namespace Tarnik::Xml::Security

#endif
