#include "named_signers.h"

#include <algorithm>
#include <array>
#include <initializer_list>
#include <utility>

#include <openssl/core_names.h>
#include <openssl/evp.h>
#include <openssl/x509.h>

#include "fixed_random.h"
#include "input.h"
#include "support/test_certificates.h"
#include "value_model.h"

namespace Fuzz {
namespace {

using namespace Tarnik;

// Of old and new RSA key, and of the first stranger.
bool HasSharedSubject(std::size_t signer) {
  return signer < 2 || signer == kTrustedSigners;
}

std::string Element(const std::string& name, const std::string& content) {
  return "<ds:" + name + ">" + content + "</ds:" + name + ">";
}

std::string DigestOf(const Crypto::Certificate& certificate, const char* algorithm,
                     const EVP_MD* digest) {
  std::array<unsigned char, EVP_MAX_MD_SIZE> value{};
  unsigned size = 0;
  Require(EVP_Digest(certificate.DerBytes(), certificate.DerLength(), value.data(), &size, digest,
                     nullptr) == 1);
  return std::string("<x:X509Digest xmlns:x=\"http://www.w3.org/2009/xmldsig11#\" Algorithm=\"") +
         algorithm + "\">" + Base64Of(value.data(), size) + "</x:X509Digest>";
}

std::string NumberOf(EVP_PKEY* key, const char* name) {
  BIGNUM* number = nullptr;
  Require(EVP_PKEY_get_bn_param(key, name, &number) == 1);
  const OpenSsl::OwnedBigNumber owner(number);
  std::vector<unsigned char> bytes(static_cast<std::size_t>(BN_num_bytes(number)));
  BN_bn2bin(number, bytes.data());
  return Base64Of(bytes.data(), bytes.size());
}

const char* CurveOf(EVP_PKEY* key) {
  switch (EVP_PKEY_get_bits(key)) {
    case 256:
      return "urn:oid:1.2.840.10045.3.1.7";
    case 384:
      return "urn:oid:1.3.132.0.34";
    default:
      return "urn:oid:1.3.132.0.35";
  }
}

// XML Signature 1.1, section 4.5.2.
std::string KeyValueOf(const NamedSigner& signer) {
  EVP_PKEY* const key = signer.key.get();
  if (!signer.isEc) {
    return Element(
        "KeyValue",
        Element("RSAKeyValue", Element("Modulus", NumberOf(key, OSSL_PKEY_PARAM_RSA_N)) +
                                   Element("Exponent", NumberOf(key, OSSL_PKEY_PARAM_RSA_E))));
  }
  std::array<unsigned char, 200> point{};
  std::size_t size = 0;
  Require(EVP_PKEY_get_octet_string_param(key, OSSL_PKEY_PARAM_PUB_KEY, point.data(), point.size(),
                                          &size) == 1);
  return Element("KeyValue",
                 std::string("<x:ECKeyValue xmlns:x=\"http://www.w3.org/2009/xmldsig11#\">"
                             "<x:NamedCurve URI=\"") +
                     CurveOf(key) + "\"/><x:PublicKey>" + Base64Of(point.data(), size) +
                     "</x:PublicKey></x:ECKeyValue>");
}

std::string EncodedKeyOf(const NamedSigner& signer) {
  unsigned char* bytes = nullptr;
  const int size = i2d_PUBKEY(signer.key.get(), &bytes);
  Require(size > 0);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return "<x:DEREncodedKeyValue xmlns:x=\"http://www.w3.org/2009/xmldsig11#\">" +
         Base64Of(bytes, static_cast<std::size_t>(size)) + "</x:DEREncodedKeyValue>";
}

std::string ContentOf(const Crypto::Certificate& certificate, HintKind kind) {
  switch (kind) {
    case HintKind::kCertificate:
      return Element("X509Certificate", Base64Of(certificate.DerBytes(), certificate.DerLength()));
    case HintKind::kIssuerSerial:
      return Element("X509IssuerSerial",
                     Element("X509IssuerName", certificate.IssuerName()) +
                         Element("X509SerialNumber", certificate.SerialNumber()));
    case HintKind::kKeyIdentifier:
      return Element("X509SKI", Base64Of(certificate.SubjectKeyIdentifier().data(),
                                         certificate.SubjectKeyIdentifier().size()));
    case HintKind::kSubject:
      return Element("X509SubjectName", certificate.SubjectName());
    case HintKind::kSha256:
      return DigestOf(certificate, "http://www.w3.org/2001/04/xmlenc#sha256", EVP_sha256());
    case HintKind::kSha384:
      return DigestOf(certificate, "http://www.w3.org/2001/04/xmldsig-more#sha384", EVP_sha384());
    case HintKind::kSha512:
      return DigestOf(certificate, "http://www.w3.org/2001/04/xmlenc#sha512", EVP_sha512());
    default:
      return DigestOf(certificate, "http://www.w3.org/2000/09/xmldsig#sha1", EVP_sha1());
  }
}

std::string TextOf(const Hint& hint) {
  const NamedSigner& signer = NamedSigners()[hint.named];
  switch (hint.kind) {
    case HintKind::kKeyValue:
      return KeyValueOf(signer);
    case HintKind::kEncodedKey:
      return EncodedKeyOf(signer);
    case HintKind::kKeyName:
      return Element("KeyName", "signer" + std::to_string(hint.named));
    default:
      return Element("X509Data", ContentOf(*signer.certificate, hint.kind));
  }
}

bool Names(const Hint& hint, std::size_t signer) {
  return hint.named == signer || (hint.kind == HintKind::kSubject && HasSharedSubject(hint.named) &&
                                  HasSharedSubject(signer));
}

/// The hints of some kinds, in their order.
std::vector<Hint> HintsOf(const std::vector<Hint>& hints, std::initializer_list<HintKind> kinds) {
  std::vector<Hint> found;
  std::copy_if(hints.begin(), hints.end(), std::back_inserter(found), [kinds](const Hint& hint) {
    return std::find(kinds.begin(), kinds.end(), hint.kind) != kinds.end();
  });
  return found;
}

std::vector<std::size_t> NamedBy(const std::vector<Hint>& hints, const Trust& trust) {
  std::vector<std::size_t> named;
  std::copy_if(trust.signers.begin(), trust.signers.end(), std::back_inserter(named),
               [&hints](std::size_t signer) {
                 return std::any_of(hints.begin(), hints.end(),
                                    [signer](const Hint& hint) { return Names(hint, signer); });
               });
  return named;
}

std::vector<std::size_t> NamedByIssuer(const std::vector<Hint>& hints, const Trust& trust) {
  std::vector<Hint> used = HintsOf(hints, {HintKind::kIssuerSerial});
  if (used.empty()) {
    used = HintsOf(hints, {HintKind::kCertificate});
    used.resize(std::min<std::size_t>(used.size(), 1), {});
  }
  std::vector<std::size_t> named = NamedBy(used, trust);
  return named.size() == 1 ? named : std::vector<std::size_t>();
}

// As `KeyInfoResolver` documents it.
std::vector<std::size_t> Selected(const std::vector<Hint>& hints, const Trust& trust) {
  if (trust.isByIssuer) {
    return NamedByIssuer(hints, trust);
  }
  // Of several certificates, the first one that is trusted is the signer's.
  for (const Hint& hint : HintsOf(hints, {HintKind::kCertificate})) {
    const auto named = NamedBy({hint}, trust);
    if (!named.empty()) {
      return named;
    }
  }
  for (const std::initializer_list<HintKind> kinds :
       {std::initializer_list<HintKind>{HintKind::kCertificate},
        {HintKind::kIssuerSerial},
        {HintKind::kKeyIdentifier},
        {HintKind::kSubject},
        {HintKind::kSha256, HintKind::kSha384, HintKind::kSha512},
        {HintKind::kKeyValue, HintKind::kEncodedKey}}) {
    const auto used = HintsOf(hints, kinds);
    const bool isIgnored = trust.signers.size() == 1 && *kinds.begin() >= HintKind::kSha256;
    if (!used.empty() && !isIgnored) {
      return NamedBy(used, trust);
    }
  }
  return trust.signers;
}

std::vector<NamedSigner> MakeNamedSigners() {
  FixRandomness(1);
  std::vector<NamedSigner> made;
  made.push_back({Testing::MakeRsaKey(2048)});
  made.push_back({Testing::MakeRsaKey(2048)});
  for (const char* curve : {"P-256", "P-384", "P-521"}) {
    made.push_back({Testing::MakeEcKey(curve), true});
  }
  made.push_back({Testing::MakeRsaKey(1024)});
  made.push_back({Testing::MakeRsaKey(2048)});
  made.push_back({Testing::MakeEcKey("P-256"), true});
  for (std::size_t i = 0; i < made.size(); ++i) {
    const std::string serial = std::to_string(i + 1);
    Testing::CertificateRecipe recipe;
    recipe.key = made[i].key.get();
    recipe.commonName = "signer" + std::to_string(HasSharedSubject(i) ? 0 : i);
    recipe.serial = serial.c_str();
    recipe.withKeyIdentifier = true;
    made[i].certificate = Testing::MakeCertificate(recipe);
  }
  return made;
}

}  // namespace

const std::vector<NamedSigner>& NamedSigners() {
  static const std::vector<NamedSigner> signers = MakeNamedSigners();
  return signers;
}

std::string KeyInfoOf(const std::vector<Hint>& hints) {
  std::string content;
  for (const Hint& hint : hints) {
    content += TextOf(hint);
  }
  return content.empty() ? "" : Element("KeyInfo", content);
}

Ref<const Xml::Security::KeyInfoResolver> ResolverFor(const Trust& trust) {
  std::vector<Ref<const Crypto::Certificate>> certificates;
  for (const std::size_t signer : trust.signers) {
    certificates.push_back(NamedSigners()[signer].certificate);
  }
  return trust.isByIssuer
             ? Xml::Security::CreateCertificateIssuerResolver(std::move(certificates))
             : Xml::Security::CreateTrustedCertificatesResolver(std::move(certificates));
}

bool IsSelected(std::size_t signer, const Trust& trust, const std::vector<Hint>& hints) {
  const auto selected = Selected(hints, trust);
  return std::find(selected.begin(), selected.end(), signer) != selected.end();
}

}  // namespace Fuzz
