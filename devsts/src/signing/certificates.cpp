#include "signing/certificates.h"

#include <array>
#include <map>
#include <memory>
#include <mutex>
#include <stdexcept>
#include <utility>

#include <arpa/inet.h>
#include <openssl/rand.h>

#include "signing/openssl_handles.h"
#include "xml/schema_values.h"

namespace DevSts {
namespace {

using GeneralNamesHandle = std::unique_ptr<GENERAL_NAMES, FreeWith<GENERAL_NAMES_free>>;
using GeneralNameHandle = std::unique_ptr<GENERAL_NAME, FreeWith<GENERAL_NAME_free>>;
using ExtensionHandle = std::unique_ptr<X509_EXTENSION, FreeWith<X509_EXTENSION_free>>;
using NumberHandle = std::unique_ptr<BIGNUM, FreeWith<BN_free>>;

EVP_PKEY* GenerateEcKey(const char* curve) {
  return EVP_PKEY_Q_keygen(nullptr, nullptr, "EC", curve);
}

KeyHandle DrawKey(KeyType type) {
  EVP_PKEY* key = nullptr;
  switch (type) {
    case KeyType::Rsa1024:
      key = EVP_RSA_gen(1024);
      break;
    case KeyType::Rsa2048:
      key = EVP_RSA_gen(2048);
      break;
    case KeyType::Rsa3072:
      key = EVP_RSA_gen(3072);
      break;
    case KeyType::EcP256:
      key = GenerateEcKey("P-256");
      break;
    case KeyType::EcP384:
      key = GenerateEcKey("P-384");
      break;
  }
  if (key == nullptr) {
    ThrowOpenSslError("key generation");
  }
  return KeyHandle(key);
}

std::string KeyPemFor(const CertificateSpec& spec) {
  if (spec.freshKey) {
    return PrivateKeyToPem(DrawKey(spec.keyType).get());
  }
  static std::mutex mutex;
  static std::map<std::pair<std::string, KeyType>, std::string> keys;
  const std::lock_guard lock(mutex);
  std::string& pem = keys[{spec.commonName, spec.keyType}];
  if (pem.empty()) {
    pem = PrivateKeyToPem(DrawKey(spec.keyType).get());
  }
  return pem;
}

void Require(bool done, const char* what) {
  if (!done) {
    ThrowOpenSslError(what);
  }
}

void SetSerialNumber(X509* certificate) {
  std::array<unsigned char, 16> octets{};
  Require(RAND_bytes(octets.data(), octets.size()) == 1, "random serial number");
  octets[0] = static_cast<unsigned char>((octets[0] & 0x7fU) | 0x40U);
  const NumberHandle number(BN_bin2bn(octets.data(), octets.size(), nullptr));
  Require(number && BN_to_ASN1_INTEGER(number.get(), X509_get_serialNumber(certificate)) != nullptr,
          "serial number");
}

void AddExtension(X509* certificate, X509* issuer, int nid, const char* value) {
  X509V3_CTX context;
  X509V3_set_ctx(&context, issuer, certificate, nullptr, nullptr, 0);
  const ExtensionHandle extension(X509V3_EXT_conf_nid(nullptr, &context, nid, value));
  Require(extension && X509_add_ext(certificate, extension.get(), -1) == 1, "extension");
}

void Push(GENERAL_NAMES* names, int type, int stringType, const std::string& octets) {
  ASN1_STRING* value = ASN1_STRING_type_new(stringType);
  Require(value != nullptr &&
              ASN1_STRING_set(value, octets.data(), static_cast<int>(octets.size())) == 1,
          "alternative name");
  GeneralNameHandle name(GENERAL_NAME_new());
  Require(name != nullptr, "alternative name");
  GENERAL_NAME_set0_value(name.get(), type, value);
  Require(sk_GENERAL_NAME_push(names, name.get()) > 0, "alternative name");
  static_cast<void>(name.release());
}

std::string AddressOctets(const std::string& text) {
  std::array<char, 16> octets{};
  if (inet_pton(AF_INET, text.c_str(), octets.data()) == 1) {
    return std::string(octets.data(), 4);
  }
  if (inet_pton(AF_INET6, text.c_str(), octets.data()) == 1) {
    return std::string(octets.data(), 16);
  }
  throw std::runtime_error("not an address: " + text);
}

void AddAlternativeNames(X509* certificate, const CertificateSpec& spec) {
  if (spec.dnsNames.empty() && spec.addresses.empty()) {
    return;
  }
  const GeneralNamesHandle names(sk_GENERAL_NAME_new_null());
  Require(names != nullptr, "alternative names");
  for (const std::string& name : spec.dnsNames) {
    Push(names.get(), GEN_DNS, V_ASN1_IA5STRING, name);
  }
  for (const std::string& address : spec.addresses) {
    Push(names.get(), GEN_IPADD, V_ASN1_OCTET_STRING, AddressOctets(address));
  }
  Require(X509_add1_ext_i2d(certificate, NID_subject_alt_name, names.get(), 0, 0) == 1,
          "alternative names");
}

void AddExtensions(X509* certificate, X509* issuer, const CertificateSpec& spec) {
  AddExtension(certificate, issuer, NID_basic_constraints,
               spec.isAuthority ? "critical,CA:TRUE" : "critical,CA:FALSE");
  AddExtension(certificate, issuer, NID_key_usage,
               spec.isAuthority ? "critical,keyCertSign,cRLSign"
                                : "critical,digitalSignature,keyEncipherment");
  AddExtension(certificate, issuer, NID_subject_key_identifier, "hash");
  if (issuer != certificate) {
    AddExtension(certificate, issuer, NID_authority_key_identifier, "keyid:always");
  }
  AddAlternativeNames(certificate, spec);
}

void SetName(X509* certificate, const std::string& commonName) {
  X509_NAME* name = X509_get_subject_name(certificate);
  const auto* octets = reinterpret_cast<const unsigned char*>(commonName.data());
  Require(X509_NAME_add_entry_by_NID(name, NID_commonName, MBSTRING_UTF8, octets,
                                     static_cast<int>(commonName.size()), -1, 0) == 1,
          "subject name");
}

}  // namespace

Credential MakeCertificate(const CertificateSpec& spec, const Credential* issuer) {
  Credential made{{}, KeyPemFor(spec)};
  const KeyHandle key = LoadPrivateKey(made.privateKeyPem);
  const CertificateHandle certificate(X509_new());
  Require(certificate && X509_set_version(certificate.get(), X509_VERSION_3) == 1, "certificate");
  SetSerialNumber(certificate.get());
  SetName(certificate.get(), spec.commonName);
  Require(X509_gmtime_adj(X509_getm_notBefore(certificate.get()), spec.notBefore.count()) &&
              X509_gmtime_adj(X509_getm_notAfter(certificate.get()), spec.notAfter.count()),
          "validity");
  Require(X509_set_pubkey(certificate.get(), key.get()) == 1, "public key");

  const CertificateHandle issuerCertificate =
      issuer != nullptr ? LoadCertificate(issuer->certificatePem) : nullptr;
  const KeyHandle issuerKey = issuer != nullptr ? LoadPrivateKey(issuer->privateKeyPem) : nullptr;
  X509* signer = issuer != nullptr ? issuerCertificate.get() : certificate.get();
  Require(X509_set_issuer_name(certificate.get(), X509_get_subject_name(signer)) == 1, "issuer");
  AddExtensions(certificate.get(), signer, spec);
  EVP_PKEY* signingKey = issuer != nullptr ? issuerKey.get() : key.get();
  Require(X509_sign(certificate.get(), signingKey, EVP_sha256()) > 0, "signing a certificate");
  made.certificatePem = CertificateToPem(certificate.get());
  return made;
}

std::string CertificateFromBase64(const std::string& der) {
  const Octets octets = FromBase64(der);
  const unsigned char* at = octets.data();
  const CertificateHandle certificate(d2i_X509(nullptr, &at, static_cast<long>(octets.size())));
  if (!certificate) {
    ThrowOpenSslError("certificate does not load");
  }
  if (at != octets.data() + octets.size()) {
    throw std::runtime_error("octets after the certificate");
  }
  return CertificateToPem(certificate.get());
}

std::string CertificateToBase64(const std::string& pem) {
  const CertificateHandle certificate = LoadCertificate(pem);
  const int size = i2d_X509(certificate.get(), nullptr);
  if (size <= 0) {
    ThrowOpenSslError("certificate cannot be written");
  }
  Octets octets(static_cast<std::size_t>(size));
  unsigned char* at = octets.data();
  i2d_X509(certificate.get(), &at);
  return ToBase64(octets);
}

std::string PlainPem(const std::string& pem) {
  return CertificateToPem(LoadCertificate(pem).get());
}

bool IsCurrent(const std::string& pem) {
  const CertificateHandle certificate = LoadCertificate(pem);
  return X509_cmp_current_time(X509_get0_notBefore(certificate.get())) < 0 &&
         X509_cmp_current_time(X509_get0_notAfter(certificate.get())) > 0;
}

bool HasSameKey(const std::string& onePem, const std::string& otherPem) {
  const CertificateHandle one = LoadCertificate(onePem);
  const CertificateHandle other = LoadCertificate(otherPem);
  return EVP_PKEY_eq(X509_get0_pubkey(one.get()), X509_get0_pubkey(other.get())) == 1;
}

bool HasStrongRsaKey(const std::string& pem) {
  const CertificateHandle certificate = LoadCertificate(pem);
  const EVP_PKEY* key = X509_get0_pubkey(certificate.get());
  return key != nullptr && EVP_PKEY_is_a(key, "RSA") == 1 && EVP_PKEY_get_bits(key) >= 2048;
}

}  // namespace DevSts
