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
/// Immutable; safe from many threads.
class TARNIK_EXPORT Signature : public virtual Object {
 public:
  virtual const std::string& CanonicalizationMethod() const = 0;
  virtual const std::string& SignatureMethod() const = 0;
  virtual const std::vector<Reference>& References() const = 0;
  virtual const Security::KeyInfo& KeyInfo() const = 0;
  /// The ds:Signature element.
  virtual ElementNode* Element() const = 0;

  /// Verifies every reference's digest and then the signature value over SignedInfo, with the key
  /// that `resolver` gives. False when a digest or the signature value does not match. Throws
  /// `XmlSecurityException` when the signature cannot be judged: an algorithm that is not on the
  /// closed list, a reference that does not hit exactly one element, no trusted key, a key that
  /// does not fit the algorithm or is too weak, or a failure of the cryptographic library.
  virtual bool Verify(const KeyInfoResolver* resolver) const = 0;
};

/// Reads `element` as a ds:Signature of its document. Throws `SignatureSyntaxException` when it
/// breaks the structure of XML-Signature; algorithms and values are judged by `Verify`.
TARNIK_EXPORT Ref<Signature> CreateSignatureFromDom(ElementNode* element);

}  // namespace Tarnik::Xml::Security

#endif
