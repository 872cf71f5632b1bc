#include "xml/security/signer_description.h"

#include <algorithm>
#include <cstddef>
#include <string_view>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/text/display_text.h>
#include <tarnik/xml/security/key_hints.h>

#include "crypto/hash.h"
#include "xml/security/algorithms.h"

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

std::string Hexadecimal(const std::vector<unsigned char>& bytes, std::size_t maxBytes) {
  constexpr char kDigits[] = "0123456789abcdef";
  std::string text;
  for (std::size_t i = 0; i < std::min(bytes.size(), maxBytes); ++i) {
    text.push_back(kDigits[bytes[i] >> 4]);
    text.push_back(kDigits[bytes[i] & 0xF]);
  }
  return "'" + text + (bytes.size() > maxBytes ? "...'" : "'");
}

std::string DescribeDigest(const KeyHints::CertificateDigest& digest) {
  if (digest.value.empty()) {
    return "whose certificate has a digest that cannot be read";
  }
  return "whose certificate has the digest " + Hexadecimal(digest.value, Crypto::kMaxHashLength) +
         " by " + Shown(digest.algorithm, kMaxName);
}

// Operators can compute the same hash of a public key file.
std::string DescribeKey(const std::vector<unsigned char>& key) {
  if (key.empty()) {
    return "whose key cannot be read";
  }
  try {
    const auto hash = Crypto::HashOf(Crypto::Hash::kSha256, key.data(), key.size());
    return "whose key has the SHA-256 hash " + Hexadecimal(hash, hash.size());
  } catch (const Crypto::CryptoException&) {
    return "which contains its key";
  }
}

// In the order in which the resolvers prefer them. A digest by another algorithm is no hint.
std::string DescribeKeyHints(const KeyHints& hints, const KeyInfo& keyInfo) {
  for (const KeyHints::CertificateDigest& digest : hints.certificateDigests) {
    if (FindDigestMethod(digest.algorithm)) {
      return DescribeDigest(digest);
    }
  }
  if (!hints.publicKeys.empty()) {
    return DescribeKey(hints.publicKeys.front());
  }
  if (!keyInfo.keyNames.empty()) {
    return "whose key is named " + Shown(keyInfo.keyNames.front(), kMaxName);
  }
  return "which names no signer";
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
    return "whose signer has the subject key identifier " +
           Hexadecimal(keyInfo.subjectKeyIdentifiers.front(), kMaxIdentifier);
  }
  if (!keyInfo.subjectNames.empty()) {
    return "whose certificate is of " + Shown(keyInfo.subjectNames.front(), kMaxName);
  }
  return DescribeKeyHints(ReadKeyHints(keyInfo), keyInfo);
}

}  // namespace Tarnik::Xml::Security
