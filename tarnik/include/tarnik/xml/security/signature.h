#ifndef TARNIK_XML_SECURITY_SIGNATURE_H
#define TARNIK_XML_SECURITY_SIGNATURE_H

#include <string>
#include <string_view>
#include <vector>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/key_info.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace Tarnik::Xml::Security {

/// One ds:Reference (XML-Signature, section 4.3.3).
struct Reference {
  std::string uri;                         ///< as written; empty for the whole document
  std::string digestMethod;                ///< the algorithm's URI
  std::vector<std::string> transforms;     ///< algorithms' URIs, in order
  std::vector<unsigned char> digestValue;  ///< the digest itself, decoded
};

/// A reference of a signature that is being made. Lives as long as the signature, which it keeps
/// alive; used by one thread at a time.
class TARNIK_EXPORT SignatureReference : public virtual Object {
 public:
  /// Adds a transform behind those that were added: enveloped-signature first, then one
  /// canonicalisation, either of them left out. Throws `XmlSecurityException` for any other
  /// algorithm or order, and `InvalidStateException` when the signature is signed; the reference is
  /// then as before.
  virtual void AddTransform(std::string_view algorithm) = 0;
};

/// An XML signature (XML-Signature Syntax and Processing, W3C) and the tree that it stands in.
///
/// A signature is either read from a document (`CreateSignatureFromDom`) or made
/// (`CreateBlankSignature`). A made one is blank until `Sign` has succeeded: by then it takes
/// references, and everything about its content (`References`, `KeyInfo`, `Verify`) throws
/// `InvalidStateException`. From then on it is like one that was read.
///
/// A signature that was read or signed is immutable and safe from many threads, as long as nobody
/// changes the tree; a blank one is used by one thread at a time.
class TARNIK_EXPORT Signature : public virtual Object {
 public:
  /// The algorithms' URIs, as written. This and what the next accessors give is valid as long as
  /// the signature.
  virtual const std::string& CanonicalizationMethod() const = 0;
  virtual const std::string& SignatureMethod() const = 0;
  /// In the order of SignedInfo.
  virtual const std::vector<Reference>& References() const = 0;
  /// What ds:KeyInfo holds; its `element` is null when there is none.
  virtual const Security::KeyInfo& KeyInfo() const = 0;
  /// The ds:Signature element. That of a made signature is there from the start and has its values
  /// once it is signed; the caller puts it into the document, before or after signing.
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

  /// Adds a reference without transforms; `uri` is of the form that `Verify` accepts. What it
  /// points at is looked up by `Sign`. Throws `XmlSecurityException` when the digest algorithm is
  /// not on the list of `Verify`, `InvalidArgumentException` when `uri` cannot stand in XML, and
  /// `InvalidStateException` unless the signature is blank and has fewer than 16 references.
  virtual Ref<SignatureReference> AddReference(std::string_view uri,
                                               std::string_view digestMethod) = 0;

  /// Makes `content` the one child of ds:KeyInfo, taking it from the parent that it had, in place
  /// of what was set before. Without this call there is no ds:KeyInfo. Throws
  /// `InvalidArgumentException` when `content` is null, holds the signature or is part of it,
  /// `SignatureSyntaxException` when a reader of the signature would refuse it (`content` is then
  /// without a parent), and `InvalidStateException` unless the signature is blank; the signature is
  /// then as before.
  virtual void SetKeyInfo(ElementNode* content) = 0;

  /// Computes the digests of all references and the signature value with `key`, and writes both
  /// into the element, in Base64 without line breaks. References, transforms and keys are held
  /// against the rules of `Verify`. The place of the element at this time counts:
  ///  - a reference with the enveloped-signature transform must enclose the element, so the element
  ///    must be in its place;
  ///  - with inclusive canonicalisation of SignedInfo the element must be in its place, since
  ///    namespaces and xml: attributes of the elements around it are part of what is signed;
  ///  - with exclusive canonicalisation it may be put into its place afterwards, anywhere in the
  ///    document that no reference covers.
  /// Attributes of the ds:Signature element itself, such as Id, are not signed and may be set
  /// later; with inclusive canonicalisation this is not true of namespaces and xml: attributes.
  ///
  /// Throws `XmlSecurityException` when a reference points at no element or at more than one, or
  /// covers what it may not, when `key` does not fit the signature algorithm or is an RSA key below
  /// 2048 bits, when the element is not in a place that it must be in, when a namespace cannot be
  /// canonicalised, and when the cryptographic library fails; `InvalidArgumentException` when `key`
  /// is null; `InvalidStateException` when there is no reference, and unless the signature is
  /// blank. The signature is then as before.
  virtual void Sign(const Crypto::PrivateKey* key) = 0;
};

/// Reads `element` as a ds:Signature of its document, in the order of the schema. Throws
/// `SignatureSyntaxException` when it breaks the structure of XML-Signature; algorithms and values
/// are judged by `Verify`. Also refused, though the schema allows them: ds:Object, a reference
/// without a URI, more than 16 references, RetrievalMethod, and comments or processing instructions
/// inside values. Throws `InvalidArgumentException` when `element` is null.
TARNIK_EXPORT Ref<Signature> CreateSignatureFromDom(ElementNode* element);

/// Makes a blank signature whose references are looked up in the document of `root`, that is, in
/// everything below the topmost node that holds `root`. Its element is not part of the document
/// yet. `c14nMethod` canonicalises SignedInfo. `prefix` is that of the signature's elements, empty
/// for none; ds:Signature declares it. Throws `XmlSecurityException` when an algorithm is not on
/// the list of `Signature::Verify`, and `InvalidArgumentException` when `root` is null or `prefix`
/// is not an NCName or is one that XML reserves; `signature` is then as before.
TARNIK_EXPORT void CreateBlankSignature(ElementNode* root, const std::string& c14nMethod,
                                        const std::string& signatureMethod,
                                        const std::string& prefix, Ref<Signature>& signature);

}  // namespace Tarnik::Xml::Security

#endif
