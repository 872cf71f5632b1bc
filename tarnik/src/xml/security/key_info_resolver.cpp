#include <algorithm>
#include <cstring>
#include <string_view>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/xml/security/key_info_resolver.h>

namespace Tarnik::Xml::Security {
namespace {

using Crypto::Certificate;
using CertificateList = std::vector<Ref<const Certificate>>;

CertificateList RequireCertificates(CertificateList certificates) {
  if (certificates.empty()) {
    throw InvalidArgumentException("A key resolver needs at least one trusted certificate.");
  }
  if (std::find(certificates.begin(), certificates.end(), nullptr) != certificates.end()) {
    throw InvalidArgumentException("A trusted certificate of a key resolver cannot be null.");
  }
  return certificates;
}

bool Equals(const Certificate& certificate, const std::vector<unsigned char>& der) {
  return certificate.DerLength() == der.size() &&
         std::memcmp(certificate.DerBytes(), der.data(), der.size()) == 0;
}

// Many programs write blanks after commas and around equals signs. Names are only hints, so
// ignoring blanks is safe.
std::string WithoutBlanks(std::string_view name) {
  std::string text(name);
  text.erase(std::remove(text.begin(), text.end(), ' '), text.end());
  return text;
}

bool IsSameName(std::string_view a, std::string_view b) {
  return a == b || WithoutBlanks(a) == WithoutBlanks(b);
}

std::string_view WithoutLeadingZeros(std::string_view number) {
  number.remove_prefix(std::min(number.find_first_not_of('0'), number.size()));
  return number;
}

bool HasIssuerSerial(const Certificate& certificate, const KeyInfo::IssuerSerial& issuerSerial) {
  return WithoutLeadingZeros(certificate.SerialNumber()) ==
             WithoutLeadingZeros(issuerSerial.serialNumber) &&
         IsSameName(certificate.IssuerName(), issuerSerial.issuerName);
}

Ref<const Crypto::PublicKey> KeyOf(const Ref<const Certificate>& certificate) {
  return certificate == nullptr ? nullptr : certificate->GetPublicKey();
}

/// The only trusted certificate that one of `hints` names; null when they name none or several.
template <class Hint, class Matches>
Ref<const Certificate> Choose(const CertificateList& trusted, const std::vector<Hint>& hints,
                              Matches matches) {
  Ref<const Certificate> chosen;
  for (const Ref<const Certificate>& certificate : trusted) {
    const bool named = std::any_of(hints.begin(), hints.end(),
                                   [&](const Hint& hint) { return matches(*certificate, hint); });
    if (!named || certificate == chosen) {
      continue;
    }
    if (chosen != nullptr) {
      return nullptr;
    }
    chosen = certificate;
  }
  return chosen;
}

class TrustedCertificatesResolver final : public KeyInfoResolver, public ObjectImpl {
 public:
  explicit TrustedCertificatesResolver(CertificateList trusted) : trusted_(std::move(trusted)) {}

  Ref<const Crypto::PublicKey> Resolve(const KeyInfo& keyInfo) const override {
    return KeyOf(Find(keyInfo));
  }

 private:
  // Only the most specific kind of hint is used.
  Ref<const Certificate> Find(const KeyInfo& keyInfo) const {
    if (!keyInfo.certificates.empty()) {
      return FindByCertificates(keyInfo);
    }
    if (!keyInfo.issuerSerials.empty()) {
      return Choose(trusted_, keyInfo.issuerSerials, HasIssuerSerial);
    }
    if (!keyInfo.subjectKeyIdentifiers.empty()) {
      return Choose(trusted_, keyInfo.subjectKeyIdentifiers,
                    [](const Certificate& certificate, const std::vector<unsigned char>& id) {
                      return certificate.SubjectKeyIdentifier() == id;
                    });
    }
    if (!keyInfo.subjectNames.empty()) {
      return Choose(trusted_, keyInfo.subjectNames,
                    [](const Certificate& certificate, const std::string& name) {
                      return IsSameName(certificate.SubjectName(), name);
                    });
    }
    return trusted_.size() == 1 ? trusted_.front() : nullptr;
  }

  // KeyInfo may contain a chain with several trusted certificates; by convention the signer's comes
  // first.
  Ref<const Certificate> FindByCertificates(const KeyInfo& keyInfo) const {
    for (const std::vector<unsigned char>& der : keyInfo.certificates) {
      for (const Ref<const Certificate>& certificate : trusted_) {
        if (Equals(*certificate, der)) {
          return certificate;
        }
      }
    }
    return nullptr;
  }

  const CertificateList trusted_;
};

class CertificateIssuerResolver final : public KeyInfoResolver, public ObjectImpl {
 public:
  explicit CertificateIssuerResolver(CertificateList trusted) : trusted_(std::move(trusted)) {}

  Ref<const Crypto::PublicKey> Resolve(const KeyInfo& keyInfo) const override {
    return KeyOf(Choose(trusted_, IssuersNamedBy(keyInfo), HasIssuerSerial));
  }

 private:
  static std::vector<KeyInfo::IssuerSerial> IssuersNamedBy(const KeyInfo& keyInfo) {
    if (!keyInfo.issuerSerials.empty() || keyInfo.certificates.empty()) {
      return keyInfo.issuerSerials;
    }
    const std::vector<unsigned char>& der = keyInfo.certificates.front();
    try {
      const auto certificate = Crypto::CreateCertificateFromDer(der.data(), der.size());
      return {{certificate->IssuerName(), certificate->SerialNumber()}};
    } catch (const Crypto::CryptoException&) {
      return {};  // an unreadable certificate names no issuer
    }
  }

  const CertificateList trusted_;
};

}  // namespace

Ref<const KeyInfoResolver> CreateTrustedCertificatesResolver(CertificateList certificates) {
  return MakeRef<TrustedCertificatesResolver>(RequireCertificates(std::move(certificates)));
}

Ref<const KeyInfoResolver> CreateCertificateIssuerResolver(CertificateList certificates) {
  return MakeRef<CertificateIssuerResolver>(RequireCertificates(std::move(certificates)));
}

}  // namespace Tarnik::Xml::Security
