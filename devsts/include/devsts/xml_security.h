#ifndef DEVSTS_XML_SECURITY_H
#define DEVSTS_XML_SECURITY_H

#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

/// XML signatures and canonical XML by libxml2 and xmlsec1: the reference that tests compare with.
/// All functions are pure and thread-safe; none writes to the standard streams.
namespace DevSts {

/// Thrown if an XML operation fails, for example because the text is not well-formed, a key cannot
/// be loaded or libxml2 refuses the canonical form. The message says what failed.
class XmlError : public std::runtime_error {
 public:
  using std::runtime_error::runtime_error;
};

/// Signature algorithms (XML Signature 1.1, section 6.4; RFC 6931, sections 2.3.2 and 2.3.10).
enum class SignatureAlgorithm {
  RsaSha256,
  RsaSha384,
  RsaSha512,
  RsaPssSha256,
  RsaPssSha384,
  RsaPssSha512,
  EcdsaSha256,
  EcdsaSha384,
  EcdsaSha512,
  RsaSha1,  ///< only for input that verifiers must refuse
};

/// Digest algorithms of a reference (XML Signature 1.1, section 6.2).
enum class DigestAlgorithm {
  Sha256,
  Sha384,
  Sha512,
  Sha1,  ///< only for input that verifiers must refuse
};

/// Canonical forms (Canonical XML 1.0; Exclusive XML Canonicalization 1.0).
enum class CanonicalMode {
  Inclusive,
  InclusiveWithComments,
  Exclusive,
  ExclusiveWithComments,
};

/// The content of a signature's KeyInfo.
enum class KeyInfoContent {
  X509Data,  ///< the signing certificate in one X509Certificate
  KeyValue,  ///< only the public key
  None,      ///< no KeyInfo element
};

/// How `SignXml` makes the signature of a text that contains no template.
struct SignOptions {
  SignatureAlgorithm signature = SignatureAlgorithm::RsaSha256;
  DigestAlgorithm digest = DigestAlgorithm::Sha256;
  /// The canonical form of SignedInfo and of the last transform of the reference.
  CanonicalMode canonicalization = CanonicalMode::Exclusive;
  /// PrefixList of the exclusive transform's InclusiveNamespaces; "#default" is the default
  /// namespace.
  std::vector<std::string> inclusivePrefixes;
  KeyInfoContent keyInfo = KeyInfoContent::X509Data;
  /// The "ID" attribute of the element to sign. If empty: the only element named Assertion, else
  /// the root element.
  std::string id;
  /// The reference's URI. If empty: "#" followed by the signed element's ID, or the empty URI if
  /// that element has no ID.
  std::string referenceUri;
};

/// Signs a document with an enveloped signature.
///
/// If the text contains a ds:Signature element, that is the template: its algorithms, references
/// and KeyInfo are kept, and empty values are filled in (an empty X509Data receives the
/// certificate). Otherwise a signature with `options` is inserted after the signed element's first
/// child if the local name of that child is Issuer, else before all children.
///
/// `keyPem` is an unencrypted private key, `certificatePem` its certificate. Returns the document
/// as libxml2 writes it, without an XML declaration; the white space, prefixes and attribute order
/// of the input are kept. Throws `XmlError`.
std::string SignXml(std::string_view xml, std::string_view keyPem, std::string_view certificatePem,
                    const SignOptions& options = {});

/// The result of `VerifyXml`.
struct VerifyResult {
  /// The digests of all references are correct, and so is the signature value under the
  /// certificate's key.
  bool valid = false;
  /// Why the signature is invalid, as reported by xmlsec1 or this library; empty for a valid
  /// signature.
  std::string reason;
  /// The URIs of the references, unchanged, in document order; for an invalid signature, those that
  /// were read.
  std::vector<std::string> referenceUris;

  explicit operator bool() const { return valid; }
};

/// Verifies the first ds:Signature in document order with the public key of `certificatePem`;
/// KeyInfo is ignored. Ids are the attributes ID, Id, wsu:Id and AssertionID. Only same-document
/// references are followed. The result is also invalid for a text that is not well-formed or
/// contains no signature. Throws `XmlError` only if the certificate cannot be loaded.
VerifyResult VerifyXml(std::string_view xml, std::string_view certificatePem);

/// The canonical form of a document, or of one element and its content.
///
/// `selector` is empty for the whole document, "#" and an id (attributes ID, Id, wsu:Id) for one
/// element, or an XPath 1.0 expression that selects exactly one element; it cannot use prefixes, so
/// write `//*[local-name()='Assertion']`. `inclusivePrefixes` applies to the exclusive forms
/// ("#default" is the default namespace). Throws `XmlError` if the text is not well-formed or has a
/// document type, the selector does not select one element, or libxml2 refuses (relative namespace
/// URIs, for example).
std::string Canonicalize(std::string_view xml, std::string_view selector, CanonicalMode mode,
                         const std::vector<std::string>& inclusivePrefixes = {});

}  // namespace DevSts

#endif
