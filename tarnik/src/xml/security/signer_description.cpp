#include "xml/security/signer_description.h"

#include <algorithm>
#include <cstddef>
#include <string_view>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/text/display_text.h>

namespace Tarnik::Xml::Security {
namespace {

constexpr std::size_t kMaxName = 256;
constexpr std::size_t kMaxNumber = 64;
constexpr std::size_t kMaxIdentifier = 32;

std::string Shown(std::string_view text, std::size_t maxBytes) {
  return "'" + ToDisplayText(text, maxBytes) + "'";
}

std::string DescribeCertificate(const std::vector<unsigned char>& der) {
  try {
    const auto certificate = Crypto::CreateCertificateFromDer(der.data(), der.size());
    return "whose certificate is of " + Shown(certificate->SubjectName(), kMaxName) +
           ", issued by " + Shown(certificate->IssuerName(), kMaxName) +
           " with the serial number " + Shown(certificate->SerialNumber(), kMaxNumber);
  } catch (const Crypto::CryptoException&) {
    return "whose certificate cannot be read";
  }
}

std::string DescribeIdentifier(const std::vector<unsigned char>& identifier) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  for (std::size_t i = 0; i < std::min(identifier.size(), kMaxIdentifier); ++i) {
    text.push_back(kDigits[identifier[i] >> 4]);
    text.push_back(kDigits[identifier[i] & 0xF]);
  }
  return "whose signer has the subject key identifier '" + text +
         (identifier.size() > kMaxIdentifier ? "...'" : "'");
}

}  // namespace

std::string DescribeSigner(const KeyInfo& keyInfo) {
  if (!keyInfo.certificates.empty()) {
    return DescribeCertificate(keyInfo.certificates.front());
  }
  if (!keyInfo.issuerSerials.empty()) {
    const KeyInfo::IssuerSerial& signer = keyInfo.issuerSerials.front();
    return "whose certificate was issued by " + Shown(signer.issuerName, kMaxName) +
           " with the serial number " + Shown(signer.serialNumber, kMaxNumber);
  }
  if (!keyInfo.subjectKeyIdentifiers.empty()) {
    return DescribeIdentifier(keyInfo.subjectKeyIdentifiers.front());
  }
  if (!keyInfo.subjectNames.empty()) {
    return "whose certificate is of " + Shown(keyInfo.subjectNames.front(), kMaxName);
  }
  if (!keyInfo.keyNames.empty()) {
    return "whose key is named " + Shown(keyInfo.keyNames.front(), kMaxName);
  }
  return "which names no signer";
}

}  // namespace Tarnik::Xml::Security
