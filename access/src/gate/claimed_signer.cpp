#include "gate/claimed_signer.h"

#include <cstddef>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_hints.h>

#include "gate/shown_text.h"

namespace SsoClient::Access {

namespace {

using Bytes = std::vector<unsigned char>;
using Tarnik::Xml::Security::KeyHints;
using Tarnik::Xml::Security::KeyInfo;

// As tools print fingerprints.
std::string HexText(const Bytes& bytes) {
  constexpr std::size_t kMostBytes = 64;  // the longest digest
  constexpr char kDigits[] = "0123456789ABCDEF";
  std::string text;
  for (const unsigned char byte : bytes) {
    if (text.size() >= 3 * kMostBytes - 1) {
      return text.append("...");
    }
    text.append(text.empty() ? "" : ":");
    text.push_back(kDigits[byte >> 4]);
    text.push_back(kDigits[byte & 0xF]);
  }
  return text;
}

std::string CertificateText(const Bytes& der) {
  try {
    const auto certificate = Tarnik::Crypto::CreateCertificateFromDer(der.data(), der.size());
    return "the certificate " + ShownText(certificate->SubjectName()) + " (SHA-256 " +
           Tarnik::Crypto::FingerprintText(*certificate) + ")";
  } catch (const Tarnik::Exception&) {
    return "a certificate that cannot be read";
  }
}

std::string HintsText(const KeyInfo& keyInfo) {
  const KeyHints hints = Tarnik::Xml::Security::ReadKeyHints(keyInfo);
  if (!hints.certificateDigests.empty()) {
    const KeyHints::CertificateDigest& digest = hints.certificateDigests.front();
    return "a certificate with the digest " + HexText(digest.value) + " by " +
           ShownText(digest.algorithm);
  }
  if (!hints.publicKeys.empty()) {
    return "a key without its certificate";
  }
  return keyInfo.keyNames.empty() ? std::string("no certificate")
                                  : "a key by the name " + ShownText(keyInfo.keyNames.front());
}

}  // namespace

std::string ClaimedSigner(const KeyInfo& keyInfo) {
  if (!keyInfo.certificates.empty()) {
    return CertificateText(keyInfo.certificates.front());
  }
  if (!keyInfo.issuerSerials.empty()) {
    const KeyInfo::IssuerSerial& signer = keyInfo.issuerSerials.front();
    return "a certificate that was issued by " + ShownText(signer.issuerName) +
           " with the serial number " + ShownText(signer.serialNumber);
  }
  if (!keyInfo.subjectKeyIdentifiers.empty()) {
    return "a certificate with the subject key identifier " +
           HexText(keyInfo.subjectKeyIdentifiers.front());
  }
  if (!keyInfo.subjectNames.empty()) {
    return "a certificate of " + ShownText(keyInfo.subjectNames.front());
  }
  return HintsText(keyInfo);
}

}  // namespace SsoClient::Access
