#ifndef TARNIK_TESTS_SUPPORT_SIGNED_DOCUMENTS_H
#define TARNIK_TESTS_SUPPORT_SIGNED_DOCUMENTS_H

#include <cstddef>
#include <initializer_list>
#include <stdexcept>
#include <string>
#include <string_view>
#include <vector>

#include <openssl/pem.h>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <tarnik/core/writer.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/security/canonicalizer.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/algorithm_uris.h"
#include "support/openssl.h"
#include "support/test_certificates.h"
#include "support/test_data.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {

/// The first element with this name in document order in any namespace, or null.
inline Xml::ElementNode* FindElement(const Xml::ParentNode* parent, std::string_view localName) {
  for (Xml::Node* node = parent->FirstChild(); node != nullptr; node = node->NextSibling()) {
    if (node->Kind() != Xml::NodeKind::kElement) {
      continue;
    }
    auto* element = static_cast<Xml::ElementNode*>(node);
    if (element->LocalName() == localName) {
      return element;
    }
    if (Xml::ElementNode* found = FindElement(element, localName)) {
      return found;
    }
  }
  return nullptr;
}

/// The credential of a signer; created once per process for each type and name.
inline DevSts::Credential SignerOf(DevSts::KeyType type, const char* name = "signer") {
  DevSts::CertificateSpec spec;
  spec.commonName = name;
  spec.keyType = type;
  return DevSts::MakeCertificate(spec);
}

inline const DevSts::Credential& Signer() {
  static const DevSts::Credential signer = SignerOf(DevSts::KeyType::Rsa2048);
  return signer;
}

inline const DevSts::Credential& Stranger() {
  static const DevSts::Credential stranger = SignerOf(DevSts::KeyType::Rsa2048, "stranger");
  return stranger;
}

inline Ref<const Crypto::Certificate> CertificateOf(const DevSts::Credential& credential) {
  return Crypto::CreateCertificatesFromPem(credential.certificatePem).front();
}

inline Ref<const Xml::Security::KeyInfoResolver> Trusting(const DevSts::Credential& credential) {
  return Xml::Security::CreateTrustedCertificatesResolver({CertificateOf(credential)});
}

/// The verdict on the first signature of a document: "valid", "invalid", or the class and message
/// of the exception.
inline std::string Verdict(std::string_view xml, const Xml::Security::KeyInfoResolver* resolver) {
  const Ref<Xml::Document> document = ParseXml(xml);
  Ref<Xml::Security::Signature> signature;
  try {
    signature = Xml::Security::CreateSignatureFromDom(FindElement(document.get(), "Signature"));
  } catch (const Xml::Security::SignatureSyntaxException& error) {
    return "syntax: " + error.Message();
  }
  try {
    return signature->Verify(resolver) ? "valid" : "invalid";
  } catch (const Xml::Security::XmlSecurityException& error) {
    return "refused: " + error.Message();
  }
}

inline std::string Verdict(std::string_view xml, const DevSts::Credential& trusted = Signer()) {
  return Verdict(xml, Trusting(trusted).get());
}

/// `text` with the first occurrence of `from` replaced.
inline std::string Replaced(std::string text, std::string_view from, std::string_view to) {
  const std::size_t place = text.find(from);
  if (place == std::string::npos) {
    throw std::runtime_error("test set-up failed: nothing to replace: " + std::string(from));
  }
  return text.replace(place, from.size(), to);
}

/// `text` with everything between `begin` and `end` replaced.
inline std::string ReplacedBetween(std::string text, std::string_view begin, std::string_view end,
                                   std::string_view to) {
  const std::size_t start = text.find(begin);
  const std::size_t stop = start == std::string::npos ? start : text.find(end, start);
  if (stop == std::string::npos) {
    throw std::runtime_error("test set-up failed: nothing to replace: " + std::string(begin));
  }
  return text.replace(start + begin.size(), stop - start - begin.size(), to);
}

/// The text between `begin` and `end`.
inline std::string Between(const std::string& text, std::string_view begin, std::string_view end) {
  const std::size_t start = text.find(begin) + begin.size();
  return text.substr(start, text.find(end, start) - start);
}

/// A document with content that canonicalisation must handle.
inline constexpr std::string_view kUnsigned =
    "<saml:Assertion xmlns:saml=\"urn:oasis:names:tc:SAML:2.0:assertion\" ID=\"_a1\" "
    "xmlns:unused=\"urn:unused\" xml:lang=\"en\">\n"
    "  <saml:Issuer>sts &amp; co</saml:Issuer>\n"
    "  <!-- a remark -->\n"
    "  <saml:Subject b=\"2\" a=\"1\"><saml:NameID>user@example</saml:NameID></saml:Subject>\n"
    "  <Plain xmlns=\"urn:plain\" value=\"x&#10;y\"/>\n"
    "</saml:Assertion>";

inline std::string Signed(const DevSts::SignOptions& options = {}, std::string_view xml = kUnsigned,
                          const DevSts::Credential& signer = Signer()) {
  return DevSts::SignXml(xml, signer.privateKeyPem, signer.certificatePem, options);
}

/// The document with a new signature value by RSA-SHA256 over its SignedInfo, so that only a digest
/// or a rule can be wrong.
inline std::string Resigned(const std::string& xml, const DevSts::Credential& signer = Signer()) {
  const Ref<Xml::Document> document = ParseXml(xml);
  const Ref<StringWriter> writer = CreateStringWriter();
  Xml::Security::CreateCanonicalizer(kExclusive)
      ->Canonicalize(FindElement(document.get(), "SignedInfo"), writer.get());
  const std::string& pem = signer.privateKeyPem;
  const OpenSsl::OwnedBio source(BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size())));
  const OpenSsl::OwnedKey key(PEM_read_bio_PrivateKey(source.get(), nullptr, nullptr, nullptr));
  const OpenSsl::OwnedDigestContext context(EVP_MD_CTX_new());
  std::vector<unsigned char> value(static_cast<std::size_t>(EVP_PKEY_get_size(key.get())));
  std::size_t length = value.size();
  const auto* text = reinterpret_cast<const unsigned char*>(writer->Text().data());
  if (EVP_DigestSignInit_ex(context.get(), nullptr, "SHA256", nullptr, nullptr, key.get(),
                            nullptr) != 1 ||
      EVP_DigestSign(context.get(), value.data(), &length, text, writer->Text().size()) != 1) {
    throw std::runtime_error("test set-up failed: signing");
  }
  return ReplacedBetween(xml, "<ds:SignatureValue>", "</ds:SignatureValue>",
                         StringUtil::Base64Encode(value));
}

/// The parts of a signature template; every part may be replaced.
struct SignatureTemplate {
  std::string canonicalization = "http://www.w3.org/2001/10/xml-exc-c14n#";
  std::string signatureMethod = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
  std::string uri = "#_a1";
  std::string transforms =
      "<ds:Transforms>"
      "<ds:Transform Algorithm=\"http://www.w3.org/2000/09/xmldsig#enveloped-signature\"/>"
      "<ds:Transform Algorithm=\"http://www.w3.org/2001/10/xml-exc-c14n#\"/>"
      "</ds:Transforms>";
  std::string digestMethod = "http://www.w3.org/2001/04/xmlenc#sha256";
  std::string moreReferences;
  std::string keyInfo;

  std::string Text() const {
    return "<ds:Signature xmlns:ds=\"http://www.w3.org/2000/09/xmldsig#\"><ds:SignedInfo>"
           "<ds:CanonicalizationMethod Algorithm=\"" +
           canonicalization + "\"/><ds:SignatureMethod Algorithm=\"" + signatureMethod +
           "\"/><ds:Reference URI=\"" + uri + "\">" + transforms + "<ds:DigestMethod Algorithm=\"" +
           digestMethod + "\"/><ds:DigestValue></ds:DigestValue></ds:Reference>" + moreReferences +
           "</ds:SignedInfo><ds:SignatureValue></ds:SignatureValue>" + keyInfo + "</ds:Signature>";
  }
};

/// An assertion around a signature template, to be signed or verified as it is.
inline std::string AssertionWith(const std::string& signature, const std::string& more = "") {
  return "<Assertion ID=\"_a1\"><Issuer>sts</Issuer>" + signature +
         "<Subject>user@example</Subject>" + more + "</Assertion>";
}

/// As above, with values that are well-formed.
inline std::string AssertionWithValues(const SignatureTemplate& signature) {
  std::string text = AssertionWith(signature.Text());
  for (const std::string_view empty :
       {"<ds:DigestValue></ds:DigestValue>", "<ds:SignatureValue></ds:SignatureValue>"}) {
    const std::string filled = std::string(empty.substr(0, empty.find("</"))) + "AAAA" +
                               std::string(empty.substr(empty.find("</")));
    std::size_t place = 0;
    while ((place = text.find(empty, place)) != std::string::npos) {
      text.replace(place, empty.size(), filled);
      place += filled.size();
    }
  }
  return text;
}

inline std::string Transforms(std::initializer_list<std::string_view> algorithms) {
  std::string text = "<ds:Transforms>";
  for (const std::string_view algorithm : algorithms) {
    text.append("<ds:Transform Algorithm=\"").append(algorithm).append("\"/>");
  }
  return text + "</ds:Transforms>";
}

}  // namespace Tarnik::Testing

#endif
