#include <climits>
#include <mutex>
#include <optional>
#include <utility>

#include <openssl/pem.h>

#include <tarnik/crypto/crypto_exception.h>

#include "crypto/certificate_cache.h"
#include "crypto/certificate_impl.h"
#include "crypto/load_file.h"
#include "crypto/pem.h"
#include "crypto/public_key_impl.h"
#include "crypto/x509_values.h"
#include "support/object_lock.h"
#include "support/openssl.h"
#include "support/openssl_error.h"

namespace Tarnik::Crypto {
namespace {

[[noreturn]] void ThrowBroken(const OpenSsl::ErrorScope& errors, const char* part) {
  throw CryptoException(
      errors.Describe(std::string("The certificate's ") + part + " cannot be decoded"));
}

OpenSsl::OwnedCertificate Decode(const std::vector<unsigned char>& der) {
  const OpenSsl::ErrorScope errors;
  if (der.empty()) {
    throw CryptoException("A certificate cannot be empty.");
  }
  if (der.size() > LONG_MAX) {
    throw CryptoException("The certificate is too long.");
  }
  const unsigned char* position = der.data();
  OpenSsl::OwnedCertificate certificate(
      d2i_X509(nullptr, &position, static_cast<long>(der.size())));
  if (certificate == nullptr) {
    throw CryptoException(errors.Describe("The certificate cannot be decoded"));
  }
  if (position != der.data() + der.size()) {
    throw CryptoException("The certificate is followed by other bytes.");
  }
  return certificate;
}

std::string NameText(const X509_NAME* name, const char* part) {
  const OpenSsl::ErrorScope errors;
  std::optional<std::string> text = TextOfName(name);
  if (!text) {
    ThrowBroken(errors, part);
  }
  return std::move(*text);
}

// RFC 5280, section 4.1.2.2 allows 20. The time to convert a number grows with the square of its
// length, and anyone can send a certificate.
constexpr int kMaxSerialBytes = 64;

std::string SerialText(const ASN1_INTEGER* serial) {
  const OpenSsl::ErrorScope errors;
  if (serial != nullptr && ASN1_STRING_length(serial) > kMaxSerialBytes) {
    throw CryptoException("The certificate's serial number has more than " +
                          std::to_string(kMaxSerialBytes) + " bytes.");
  }
  const OpenSsl::OwnedBigNumber number(ASN1_INTEGER_to_BN(serial, nullptr));
  const OpenSsl::OwnedMemory<char> text(number == nullptr ? nullptr : BN_bn2dec(number.get()));
  if (text == nullptr) {
    ThrowBroken(errors, "serial number");
  }
  return text.get();
}

System::DateTime Time(const ASN1_TIME* time, const char* part) {
  const OpenSsl::ErrorScope errors;
  const std::optional<System::DateTime> instant = InstantOf(time);
  if (!instant) {
    ThrowBroken(errors, part);
  }
  return *instant;
}

std::vector<unsigned char> SubjectKeyIdentifierOf(X509* certificate) {
  const OpenSsl::ErrorScope errors;
  const ASN1_OCTET_STRING* identifier = X509_get0_subject_key_id(certificate);
  if (identifier == nullptr) {
    return {};
  }
  const unsigned char* bytes = ASN1_STRING_get0_data(identifier);
  return {bytes, bytes + ASN1_STRING_length(identifier)};
}

Ref<const PublicKey> KeyOf(X509* certificate) {
  const OpenSsl::ErrorScope errors;
  OpenSsl::OwnedKey key(X509_get_pubkey(certificate));
  return key == nullptr ? nullptr : Ref<const PublicKey>(new PublicKeyImpl(std::move(key)));
}

std::vector<unsigned char> ComputedKeyIdentifier(X509* certificate) {
  const OpenSsl::ErrorScope errors;
  std::vector<unsigned char> hash(EVP_MAX_MD_SIZE);
  unsigned int length = 0;
  if (X509_pubkey_digest(certificate, EVP_sha1(), hash.data(), &length) != 1) {
    return {};
  }
  hash.resize(length);
  return hash;
}

std::vector<unsigned char> PublicKeyInfo(X509* certificate) {
  const OpenSsl::ErrorScope errors;
  unsigned char* bytes = nullptr;
  const int length = i2d_X509_PUBKEY(X509_get_X509_PUBKEY(certificate), &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  if (length <= 0) {
    ThrowBroken(errors, "public key");
  }
  return {bytes, bytes + length};
}

std::string_view EncodingOf(const Certificate& certificate) noexcept {
  return {reinterpret_cast<const char*>(certificate.DerBytes()), certificate.DerLength()};
}

}  // namespace

CertificateImpl::CertificateImpl(std::vector<unsigned char> der, X509* decoded)
    : der_(std::move(der)),
      subjectName_(NameText(X509_get_subject_name(decoded), "subject name")),
      issuerName_(NameText(X509_get_issuer_name(decoded), "issuer name")),
      subject_(X509_get_subject_name(decoded)),
      issuer_(X509_get_issuer_name(decoded)),
      serialNumber_(SerialText(X509_get0_serialNumber(decoded))),
      notBefore_(Time(X509_get0_notBefore(decoded), "start of validity")),
      notAfter_(Time(X509_get0_notAfter(decoded), "end of validity")),
      subjectKeyIdentifier_(SubjectKeyIdentifierOf(decoded)),
      computedKeyIdentifier_(subjectKeyIdentifier_.empty() ? ComputedKeyIdentifier(decoded)
                                                           : std::vector<unsigned char>()),
      keyInfo_(PublicKeyInfo(decoded)),
      publicKey_(KeyOf(decoded)) {}

CertificateImpl::~CertificateImpl() = default;

Ref<const PublicKey> CertificateImpl::GetPublicKey() const {
  if (publicKey_ == nullptr) {
    throw CryptoException("The certificate's public key is broken or of an unknown kind.");
  }
  return publicKey_;
}

Sha256Digest CertificateImpl::Fingerprint() const {
  if (hasFingerprint_.load(std::memory_order_acquire)) {
    return fingerprint_;
  }
  const Sha256Digest computed = Sha256(EncodingOf(*this));
  const std::lock_guard lock(ObjectLock(this));
  if (!hasFingerprint_.load(std::memory_order_relaxed)) {
    fingerprint_ = computed;
    hasFingerprint_.store(true, std::memory_order_release);
  }
  return computed;
}

std::string CertificateImpl::ToString() const {
  return "Certificate of " + subjectName_;
}

Ref<const Certificate> CreateCertificateFromDer(const unsigned char* bytes, std::size_t length) {
  if (bytes == nullptr) {
    throw CryptoException("A certificate cannot be empty.");
  }
  CertificateCache& cache = ProcessCertificateCache();
  if (auto known = cache.Find({reinterpret_cast<const char*>(bytes), length})) {
    return known;
  }
  std::vector<unsigned char> der(bytes, bytes + length);
  const OpenSsl::OwnedCertificate decoded = Decode(der);
  const auto certificate = MakeRef<const CertificateImpl>(std::move(der), decoded.get());
  cache.Add(certificate);
  return certificate;
}

std::vector<Ref<const Certificate>> CreateCertificatesFromPem(std::string_view pem) {
  PemReader reader(pem);
  std::vector<Ref<const Certificate>> certificates;
  for (;;) {
    PemBlock block;
    if (!reader.Next(block)) {
      break;
    }
    if (block.Label() == PEM_STRING_X509) {
      certificates.push_back(CreateCertificateFromDer(block.Bytes(), block.Size()));
    }
  }
  if (certificates.empty()) {
    throw CryptoException(std::string("The PEM text holds no certificate") +
                          DescribeMissingPem(pem));
  }
  return certificates;
}

std::vector<Ref<const Certificate>> LoadCertificates(const std::string& path) {
  return LoadFile("certificate", path, {},
                  [](std::string_view pem, const PassphraseCallback& /*passphrase*/) {
                    return CreateCertificatesFromPem(pem);
                  });
}

std::vector<Ref<const Certificate>> CreateCertificatesFromPemOrDer(std::string_view content) {
  if (!StartsLikeDer(content)) {
    return CreateCertificatesFromPem(content);
  }
  const auto* bytes = reinterpret_cast<const unsigned char*>(content.data());
  return {CreateCertificateFromDer(bytes, content.size())};
}

std::vector<Ref<const Certificate>> LoadPemOrDerCertificates(const std::string& path) {
  return LoadFile("certificate", path, {},
                  [](std::string_view content, const PassphraseCallback& /*passphrase*/) {
                    return CreateCertificatesFromPemOrDer(content);
                  });
}

bool IsSameCertificate(const Certificate& a, const Certificate& b) noexcept {
  return a.DerLength() == b.DerLength() &&
         IsEqualInConstantTime(a.DerBytes(), b.DerBytes(), a.DerLength());
}

Sha256Digest Fingerprint(const Certificate& certificate) {
  const auto* decoded = dynamic_cast<const CertificateImpl*>(&certificate);
  return decoded == nullptr ? Sha256(EncodingOf(certificate)) : decoded->Fingerprint();
}

std::string FingerprintText(const Certificate& certificate) {
  constexpr const char* kDigits = "0123456789ABCDEF";
  std::string text;
  for (const unsigned char byte : Fingerprint(certificate)) {
    if (!text.empty()) {
      text += ':';
    }
    text += kDigits[byte >> 4];
    text += kDigits[byte & 0xF];
  }
  return text;
}

}  // namespace Tarnik::Crypto
