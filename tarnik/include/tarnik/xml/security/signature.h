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

/// One ds:Reference (XML Signature 1.1, section 4.4.3).
struct Reference {
  std::string uri;                         ///< as written; empty for the whole document
  std::string digestMethod;                ///< the algorithm's URI
  std::vector<std::string> transforms;     ///< algorithms' URIs, in order
  std::vector<unsigned char> digestValue;  ///< the digest itself, decoded
};

/// A reference of a signature that is being created. It keeps the signature alive; used by one
/// thread at a time.
class TARNIK_EXPORT SignatureReference : public virtual Object {
 public:
  /// Adds a transform after those that were added: first enveloped-signature, then one
  /// canonicalisation, both optional. Throws `XmlSecurityException` for any other algorithm or
  /// order, and `InvalidStateException` when the signature is signed; the reference is then
  /// unchanged.
  virtual void AddTransform(std::string_view algorithm) = 0;
};

/// An XML signature (W3C XML Signature Syntax and Processing 1.1) and the tree that contains it.
///
/// A signature is either read from a document (`CreateSignatureFromDom`) or created
/// (`CreateBlankSignature`). A created signature is blank until `Sign` has succeeded: until then it
/// accepts references, and all functions about its content (`References`, `KeyInfo`, `Verify`)
/// throw `InvalidStateException`. From then on it behaves like one that was read.
///
/// A signature that was read or signed is immutable and thread-safe, as long as nobody modifies the
/// tree; a blank one is used by one thread at a time.
class TARNIK_EXPORT Signature : public virtual Object {
 public:
  /// The URI of the algorithm, as written. This and the results of the next accessors are valid as
  /// long as the signature.
  virtual const std::string& CanonicalizationMethod() const = 0;
  /// The algorithm of the signature value.
  virtual const std::string& SignatureMethod() const = 0;
  /// In the order of SignedInfo.
  virtual const std::vector<Reference>& References() const = 0;
  /// The content of ds:KeyInfo; its `element` is null when there is no ds:KeyInfo.
  virtual const Security::KeyInfo& KeyInfo() const = 0;
  /// The ds:Signature element. That of a created signature exists from the start and has its values
  /// once it is signed; the caller inserts it into the document, before or after signing.
  virtual ElementNode* Element() const = 0;

  /// Verifies the signature value over SignedInfo with the key that `resolver` returns, and then
  /// the digest of every reference. False when any of them does not match. If `resolver` is a
  /// `KeyCandidatesResolver` that returns several keys, at most 16 of them are tried for the
  /// signature value, and if none has made it, there is no trusted key. Nothing is computed before
  /// all algorithms and references have been validated, and nothing is ever fetched.
  ///
  /// The supported algorithms are a closed list, compared as whole URIs:
  ///  - signatures: RSA PKCS#1 v1.5, RSA-PSS (RFC 6931, section 2.3.10) and ECDSA on P-256, P-384
  ///    and P-521, each with SHA-256, SHA-384 or SHA-512; RSA keys of at least 2048 bits. An ECDSA
  ///    value has two halves of equal length, at most that of the order of the curve;
  ///  - digests: SHA-256, SHA-384 and SHA-512;
  ///  - canonicalisations: those of `CreateCanonicalizer`;
  ///  - transforms: enveloped-signature and then one canonicalisation, both optional.
  /// An InclusiveNamespaces element in enveloped-signature has no effect; other parameters that an
  /// algorithm does not take are refused.
  ///
  /// The URI of a reference is empty (the whole document) or "#" followed by the id of exactly one
  /// element of the document: an attribute "ID", "Id" or "id", xml:id, or wsu:Id. No second element
  /// may have that value as its `PossibleId` (`ids.h`). The target of a reference must either
  /// enclose the signature and have the enveloped-signature transform, or be outside of it and not
  /// have this transform.
  ///
  /// Throws `XmlSecurityException` when the signature cannot be verified: `resolver` is null, an
  /// algorithm is not on the list, a reference is not as above, there is no trusted key, the key
  /// does not fit the algorithm or is too weak, a namespace cannot be canonicalised, or the
  /// cryptographic library fails. Exceptions of the resolver pass through unchanged.
  virtual bool Verify(const KeyInfoResolver* resolver) const = 0;

  /// Adds a reference without transforms; `uri` is of the form that `Verify` accepts. `Sign` looks
  /// up its target. Throws `XmlSecurityException` when the digest algorithm is not on the list of
  /// `Verify`, `InvalidArgumentException` when `uri` contains what XML does not allow, and
  /// `InvalidStateException` unless the signature is blank and has fewer than 16 references.
  virtual Ref<SignatureReference> AddReference(std::string_view uri,
                                               std::string_view digestMethod) = 0;

  /// Makes `content` the only child of ds:KeyInfo, in place of the content that was set before, and
  /// removes it from its previous parent. Without this call there is no ds:KeyInfo. Throws
  /// `InvalidArgumentException` when `content` is null, contains the signature or is part of it,
  /// `SignatureSyntaxException` when `CreateSignatureFromDom` would reject it (`content` then has
  /// no parent), and `InvalidStateException` unless the signature is blank; the signature is then
  /// unchanged.
  virtual void SetKeyInfo(ElementNode* content) = 0;

  /// Computes the digests of all references and the signature value with `key`, and writes both
  /// into the element, in Base64 without line breaks. References, transforms and keys must follow
  /// the rules of `Verify`. Where the element must be when `Sign` is called:
  ///  - a reference with the enveloped-signature transform must enclose the element, so the element
  ///    must be in its final position;
  ///  - with inclusive canonicalisation of SignedInfo it must be there too, since namespaces and
  ///    xml: attributes of the elements around it are part of what is signed;
  ///  - otherwise it may be inserted into the document afterwards, where no reference covers it.
  /// Attributes of the ds:Signature element itself, such as Id, are not signed and may be set
  /// later, except that inclusive canonicalisation signs its namespaces and xml: attributes.
  ///
  /// Throws `XmlSecurityException` when a reference has no target or more than one, or a target
  /// that is not allowed, when `key` does not fit the signature algorithm or is an RSA key below
  /// 2048 bits, when the element is not in the document but must be, when a namespace cannot be
  /// canonicalised, and when the cryptographic library fails; `InvalidArgumentException` when `key`
  /// is null; `InvalidStateException` when there is no reference, and unless the signature is
  /// blank. The signature is then unchanged.
  virtual void Sign(const Crypto::PrivateKey* key) = 0;
};

/// Reads `element`, a ds:Signature of its document, whose children must be in the order of the
/// schema. Throws `SignatureSyntaxException` when it violates the structure of XML Signature;
/// algorithms and values are checked by `Verify`. Also rejected, although the schema allows them:
/// ds:Object, a reference without a URI, more than 16 references, RetrievalMethod, and comments or
/// processing instructions inside values. Throws `InvalidArgumentException` when `element` is null.
TARNIK_EXPORT Ref<Signature> CreateSignatureFromDom(ElementNode* element);

/// Creates a blank signature whose references are looked up in the document of `root`, that is, in
/// the whole tree that contains `root`. Its element is not part of the document yet. `c14nMethod`
/// canonicalises SignedInfo. `prefix` is the prefix of the signature's elements, empty for none;
/// ds:Signature declares it. Throws `XmlSecurityException` when an algorithm is not on the list of
/// `Signature::Verify`, and `InvalidArgumentException` when `root` is null or `prefix` is not an
/// NCName or is reserved by XML; `signature` is then unchanged.
TARNIK_EXPORT void CreateBlankSignature(ElementNode* root, const std::string& c14nMethod,
                                        const std::string& signatureMethod,
                                        const std::string& prefix, Ref<Signature>& signature);

}  // namespace Tarnik::Xml::Security

#endif
