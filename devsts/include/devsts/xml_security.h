#ifndef DEVSTS_XML_SECURITY_H
#define DEVSTS_XML_SECURITY_H

#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

/// XML signatures and canonical XML made by libxml2 and xmlsec1: the second opinion that tests
/// compare with. Every function is pure and safe to call from any number of threads at once; none
/// writes to the standard streams.
namespace DevSts {

/// Raised when an XML operation cannot be carried out at all: a text that is not well-formed, a key
/// that does not load, a canonical form that libxml2 refuses. The message says what failed.
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
  RsaSha1,  ///< only to make what a careful reader refuses
};

/// Digest algorithms of a reference (XML Signature 1.1, section 6.2).
enum class DigestAlgorithm {
  Sha256,
  Sha384,
  Sha512,
  Sha1,  ///< only to make what a careful reader refuses
};

/// Canonical forms (Canonical XML 1.0; Exclusive XML Canonicalization 1.0).
enum class CanonicalMode {
  Inclusive,
  InclusiveWithComments,
  Exclusive,
  ExclusiveWithComments,
};

/// What a signature's KeyInfo carries.
enum class KeyInfoContent {
  X509Data,  ///< the signing certificate in one X509Certificate
  KeyValue,  ///< the bare public key
  None,      ///< no KeyInfo element
};

/// How `SignXml` makes the signature of a text that holds no template of its own.
struct SignOptions {
  SignatureAlgorithm signature = SignatureAlgorithm::RsaSha256;
  DigestAlgorithm digest = DigestAlgorithm::Sha256;
  /// Canonical form of SignedInfo and the last transform of the reference.
  CanonicalMode canonicalization = CanonicalMode::Exclusive;
  /// PrefixList of the exclusive transform's InclusiveNamespaces; "#default" names the default one.
  std::vector<std::string> inclusivePrefixes;
  KeyInfoContent keyInfo = KeyInfoContent::X509Data;
  /// Id of the element to sign: its "ID" attribute. Empty: the only element of the name Assertion,
  /// else the root element.
  std::string id;
  /// The reference's URI as it is to stand. Empty: "#" followed by the signed element's ID, or the
  /// empty URI if that element has none.
  std::string referenceUri;
};

/// Signs a document with an enveloped signature.
///
/// A text that holds a ds:Signature element is signed by that template as it stands: its
/// algorithms, references and KeyInfo are kept, empty values are filled in (X509Data that is empty
/// receives the certificate). Without one a signature by `options` is put behind the signed
/// element's first child if that child's local name is Issuer, else in front of all children.
///
/// `keyPem` is an unencrypted private key, `certificatePem` its certificate. Returns the document
/// as libxml2 writes it, without an XML declaration; white space, prefixes and attribute order of
/// the input are kept. Throws `XmlError`.
std::string SignXml(std::string_view xml, std::string_view keyPem, std::string_view certificatePem,
                    const SignOptions& options = {});

/// The verdict of `VerifyXml`.
struct VerifyResult {
  /// Every reference's digest and the signature value are right under the given certificate's key.
  bool valid = false;
  /// Why not, in xmlsec1's words or ours; empty for a valid signature.
  std::string reason;
  /// URIs of the references, in document order, as they stand; present for invalid signatures as
  /// far as read.
  std::vector<std::string> referenceUris;

  explicit operator bool() const { return valid; }
};

/// Verifies the first ds:Signature in document order with the public key of `certificatePem`;
/// KeyInfo is not looked at. Ids are the attributes named ID, Id and wsu:Id, as well as
/// AssertionID. Only same-document references are followed. A text that is not well-formed or holds
/// no signature is an invalid result, too. Throws `XmlError` only for a certificate that does not
/// load.
VerifyResult VerifyXml(std::string_view xml, std::string_view certificatePem);

/// The canonical form of a document or of one element with its content.
///
/// `selector` is empty for the whole document, "#" and an id (attributes ID, Id, wsu:Id) for one
/// element, or an XPath 1.0 expression that gives exactly one element; no prefixes are bound for
/// it, so write `//*[local-name()='Assertion']`. `inclusivePrefixes` is used by the exclusive forms
/// ("#default" is the default namespace). Throws `XmlError` when the text is not well-formed, has a
/// document type, the selector does not name one element, or libxml2 refuses (relative namespace
/// URIs, for instance).
std::string Canonicalize(std::string_view xml, std::string_view selector, CanonicalMode mode,
                         const std::vector<std::string>& inclusivePrefixes = {});

}  // namespace DevSts

#endif
