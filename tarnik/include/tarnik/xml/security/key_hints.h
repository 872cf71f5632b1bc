#ifndef TARNIK_XML_SECURITY_KEY_HINTS_H
#define TARNIK_XML_SECURITY_KEY_HINTS_H

#include <cstddef>
#include <string>
#include <vector>

#include <tarnik/export.h>
#include <tarnik/xml/security/key_info.h>

namespace Tarnik::Xml::Security {

/// What a ds:KeyInfo says about the key itself, besides the content of `KeyInfo`. These are
/// untrusted hints too: anybody can write any key into a message.
struct KeyHints {
  /// Further hints of a kind are not read.
  static constexpr std::size_t kMaxOfEachKind = 16;

  /// A dsig11:X509Digest (XML Signature 1.1, section 4.5.4): the digest of the signer's
  /// certificate.
  struct CertificateDigest {
    std::string algorithm;             ///< the algorithm's URI, as written
    std::vector<unsigned char> value;  ///< the digest; empty when it cannot be decoded
  };

  std::vector<CertificateDigest> certificateDigests;  ///< in document order
  /// The signer's public keys in document order, each as SubjectPublicKeyInfo (RFC 5280, section
  /// 4.1.2.7) in DER. A dsig11:DEREncodedKeyValue (XML Signature 1.1, section 4.5.9) is returned
  /// unchanged, also when it is not a key. An RSAKeyValue and a dsig11:ECKeyValue on a named curve
  /// with an uncompressed point (section 4.5.2) are converted. Empty for one that cannot be read.
  std::vector<std::vector<unsigned char>> publicKeys;
};

/// Reads the hints in the element of `keyInfo`; all are empty when it has none. Values that cannot
/// be read are empty, and other kinds of keys are skipped: the function throws no exception because
/// of a message. Its work is linear in the size of the element. Thread-safe, as long as nobody
/// modifies the tree of the element.
TARNIK_EXPORT KeyHints ReadKeyHints(const KeyInfo& keyInfo);

}  // namespace Tarnik::Xml::Security

#endif
