#ifndef TARNIK_TESTS_SUPPORT_KEY_INFO_TEXTS_H
#define TARNIK_TESTS_SUPPORT_KEY_INFO_TEXTS_H

#include <string>
#include <vector>

#include <tarnik/crypto/certificate.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/key_info.h>

#include "crypto/certificate_impl.h"
#include "crypto/hash.h"
#include "support/openssl.h"
#include "support/test_certificates.h"
#include "support/xml_text.h"
#include "xml/security/key_info_reader.h"

namespace Tarnik::Testing {

inline constexpr const char* kSha256Uri = "http://www.w3.org/2001/04/xmlenc#sha256";
inline constexpr const char* kSha384Uri = "http://www.w3.org/2001/04/xmldsig-more#sha384";
inline constexpr const char* kSha512Uri = "http://www.w3.org/2001/04/xmlenc#sha512";

/// A KeyInfo element; its content may use the prefix "d" for elements of XML Signature 1.1.
inline std::string KeyInfoText(const std::string& content) {
  return "<KeyInfo xmlns=\"http://www.w3.org/2000/09/xmldsig#\" "
         "xmlns:d=\"http://www.w3.org/2009/xmldsig11#\">" +
         content + "</KeyInfo>";
}

/// What the reader makes of a KeyInfo element with this content.
inline Xml::Security::KeyInfo ReadHints(const std::string& content) {
  return Xml::Security::ReadKeyInfo(ParseXml(KeyInfoText(content))->RootElement());
}

inline std::string DigestText(const std::string& algorithm, const std::string& base64) {
  return "<X509Data><d:X509Digest Algorithm=\"" + algorithm + "\">" + base64 +
         "</d:X509Digest></X509Data>";
}

inline std::string DigestOf(const Crypto::Certificate& certificate, const std::string& algorithm,
                            Crypto::Hash hash) {
  return DigestText(algorithm, StringUtil::Base64Encode(Crypto::HashOf(hash, certificate.DerBytes(),
                                                                       certificate.DerLength())));
}

inline std::string DerEncodedKey(const Crypto::Certificate& certificate) {
  return "<d:DEREncodedKeyValue>" +
         StringUtil::Base64Encode(
             dynamic_cast<const Crypto::CertificateImpl&>(certificate).SubjectPublicKeyInfo()) +
         "</d:DEREncodedKeyValue>";
}

inline std::string RsaKeyValue(const std::string& modulus, const std::string& exponent) {
  return "<KeyValue>\n<RSAKeyValue><Modulus>" + modulus + "</Modulus><!-- e --><Exponent>" +
         exponent + "</Exponent>\n</RSAKeyValue></KeyValue>";
}

inline std::string EcKeyValue(const std::string& curve, const std::string& point) {
  return "<KeyValue><d:ECKeyValue><d:NamedCurve URI=\"" + curve + "\"/><d:PublicKey>" + point +
         "</d:PublicKey></d:ECKeyValue></KeyValue>";
}

/// The point of an EC key in uncompressed form, in Base64.
inline std::string UncompressedPointOf(EVP_PKEY* key) {
  std::vector<unsigned char> point(200);
  std::size_t length = 0;
  Require(EVP_PKEY_get_octet_string_param(key, "encoded-pub-key", point.data(), point.size(),
                                          &length) == 1,
          "point");
  point.resize(length);
  return StringUtil::Base64Encode(point);
}

}  // namespace Tarnik::Testing

#endif
