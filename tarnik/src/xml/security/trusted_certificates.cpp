#include "xml/security/trusted_certificates.h"

#include <algorithm>
#include <cstring>
#include <limits>
#include <map>
#include <mutex>
#include <optional>
#include <span>
#include <string_view>
#include <utility>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>

#include "crypto/distinguished_name.h"
#include "crypto/public_key_impl.h"
#include "crypto/public_key_info.h"
#include "support/object_lock.h"
#include "support/openssl_error.h"
#include "xml/security/algorithms.h"

namespace Tarnik::Xml::Security {
namespace {

using Crypto::Certificate;
using Crypto::CertificateImpl;
using Crypto::DistinguishedName;
using Bytes = std::vector<unsigned char>;

// Of each kind, only the first hints are used, which limits the work for one signature.
constexpr std::size_t kMaxHints = 16;
constexpr std::size_t kNoKey = std::numeric_limits<std::size_t>::max();

/// The hints that are used.
template <class Hint>
std::span<const Hint> FirstOf(const std::vector<Hint>& hints) {
  return std::span(hints).first(std::min(hints.size(), kMaxHints));
}

template <class List, class Matches>
bool AnyOf(List& list, Matches matches) {
  return std::any_of(list.begin(), list.end(), matches);
}

std::string_view WithoutLeadingZeros(std::string_view number) noexcept {
  number.remove_prefix(std::min(number.find_first_not_of('0'), number.size()));
  return number;
}

/// A distinguished name in a message.
class NameHint {
 public:
  explicit NameHint(std::string_view text) : text_(text) {}

  /// True if it is the name that the library prints as `text`, or that equals `name`, which may be
  /// null. Some types of strings have the same text, but are not equal.
  bool Names(std::string_view text, const DistinguishedName* name) {
    if (text_ == text && !text.empty()) {
      return true;
    }
    // Read when it is needed, since that takes much longer than a comparison.
    if (!name_) {
      name_ = DistinguishedName::FromText(text_);
    }
    return name != nullptr && name_->Equals(*name);
  }

 private:
  std::string_view text_;
  std::optional<DistinguishedName> name_;
};

const DistinguishedName* IssuerOf(const CertificateImpl* certificate) noexcept {
  return certificate == nullptr ? nullptr : &certificate->Issuer();
}

const DistinguishedName* SubjectOf(const CertificateImpl* certificate) noexcept {
  return certificate == nullptr ? nullptr : &certificate->Subject();
}

/// A digest by a supported algorithm.
struct SupportedDigest {
  Crypto::Hash hash;
  const Bytes* value;
};

std::vector<SupportedDigest> SupportedDigestsIn(const KeyHints& hints) {
  std::vector<SupportedDigest> digests;
  for (const KeyHints::CertificateDigest& digest : hints.certificateDigests) {
    const auto hash = FindDigestMethod(digest.algorithm);
    if (hash && digests.size() < kMaxHints) {
      digests.push_back({*hash, &digest.value});
    }
  }
  return digests;
}

/// The certificate as this library implements it, decoded from its bytes if a caller implements it;
/// null if they cannot be decoded.
Ref<const CertificateImpl> DecodedFrom(const Certificate& certificate) {
  if (const auto* implementation = dynamic_cast<const CertificateImpl*>(&certificate)) {
    return Ref<const CertificateImpl>(implementation);
  }
  try {
    const auto decoded =
        Crypto::CreateCertificateFromDer(certificate.DerBytes(), certificate.DerLength());
    return Ref<const CertificateImpl>(dynamic_cast<const CertificateImpl*>(decoded.get()));
  } catch (const Crypto::CryptoException&) {
    return nullptr;
  }
}

/// What identifies a key: its usual form, in which hints contain it, or else what contains the key.
Bytes IdentityOf(const Crypto::PublicKey& key, const Certificate& certificate,
                 const CertificateImpl* decoded) {
  const auto* implementation = dynamic_cast<const Crypto::PublicKeyImpl*>(&key);
  if (decoded == nullptr || implementation == nullptr) {
    return Bytes(certificate.DerBytes(), certificate.DerBytes() + certificate.DerLength());
  }
  const Bytes& encoded = decoded->SubjectPublicKeyInfo();
  // Computing the usual form takes much longer than recognising it.
  if (Crypto::IsUsualPublicKeyInfo(*implementation, encoded.size())) {
    return encoded;
  }
  const Bytes usual = Crypto::UsualPublicKeyInfo(*implementation);
  return usual.empty() ? encoded : usual;
}

/// What certificates of one key have in common. An RSA key for PSS only is another key than one of
/// the same numbers for every scheme, and may be restricted to one hash.
std::string_view CommonPartOf(const Crypto::PublicKey& key, const CertificateImpl* decoded,
                              const Bytes& identity) {
  const bool isForPssOnly = key.Algorithm() == Crypto::KeyAlgorithm::kRsaPss;
  const Bytes& bytes =
      isForPssOnly && decoded != nullptr ? decoded->SubjectPublicKeyInfo() : identity;
  return {reinterpret_cast<const char*>(bytes.data()), bytes.size()};
}

Ref<const Crypto::PublicKey> KnownKeyOf(const Certificate& certificate) {
  try {
    return certificate.GetPublicKey();
  } catch (const Crypto::CryptoException&) {
    return nullptr;
  }
}

}  // namespace

TrustedCertificates::TrustedCertificates(CertificateList certificates) {
  if (certificates.empty()) {
    throw InvalidArgumentException("A key resolver needs at least one trusted certificate.");
  }
  if (std::find(certificates.begin(), certificates.end(), nullptr) != certificates.end()) {
    throw InvalidArgumentException("A trusted certificate of a key resolver cannot be null.");
  }
  for (Ref<const Certificate>& certificate : certificates) {
    Ref<const CertificateImpl> decoded = DecodedFrom(*certificate);
    list_.push_back({std::move(certificate), std::move(decoded), kNoKey, {}});
  }
  if (list_.size() > 1) {
    CollectKeys();
  }
}

void TrustedCertificates::CollectKeys() {
  std::map<std::string_view, std::size_t> places;
  for (Trusted& trusted : list_) {
    const Ref<const Crypto::PublicKey> key = KnownKeyOf(*trusted.certificate);
    if (key == nullptr) {
      continue;
    }
    trusted.identity = IdentityOf(*key, *trusted.certificate, trusted.decoded.get());
    const auto [place, isNew] =
        places.emplace(CommonPartOf(*key, trusted.decoded.get(), trusted.identity), keys_.size());
    trusted.key = place->second;
    if (isNew) {
      keys_.push_back(key);
    }
  }
}

TrustedCertificates::Keys TrustedCertificates::NamedBy(const KeyInfo& keyInfo) const {
  return KeysOf(SelectBy(keyInfo));
}

TrustedCertificates::CertificateList TrustedCertificates::CertificatesNamedBy(
    const KeyInfo& keyInfo) const {
  const Selection selection = SelectBy(keyInfo);
  if (selection.size() == 1) {
    static_cast<void>(selection.front()->certificate->GetPublicKey());  // throws if it is not known
    return {selection.front()->certificate};
  }
  CertificateList certificates;
  for (const Trusted* trusted : selection) {
    if (trusted->key != kNoKey) {
      certificates.push_back(trusted->certificate);
    }
  }
  return certificates;
}

TrustedCertificates::Selection TrustedCertificates::SelectBy(const KeyInfo& keyInfo) const {
  if (!keyInfo.certificates.empty()) {
    return SelectByCertificates(keyInfo.certificates);
  }
  if (!keyInfo.issuerSerials.empty()) {
    return SelectByIssuerSerials(keyInfo.issuerSerials);
  }
  if (!keyInfo.subjectKeyIdentifiers.empty()) {
    return SelectByKeyIdentifiers(keyInfo.subjectKeyIdentifiers);
  }
  if (!keyInfo.subjectNames.empty()) {
    return SelectBySubjectNames(keyInfo.subjectNames);
  }
  if (list_.size() == 1) {
    return {&list_.front()};
  }
  return SelectByKeyHints(ReadKeyHints(keyInfo));
}

TrustedCertificates::Selection TrustedCertificates::SelectByKeyHints(const KeyHints& hints) const {
  if (!SupportedDigestsIn(hints).empty()) {
    return SelectByDigests(hints);
  }
  return hints.publicKeys.empty() ? Select([](const Trusted&) { return true; })
                                  : SelectByPublicKeys(hints.publicKeys);
}

TrustedCertificates::Keys TrustedCertificates::NamedByIssuer(const KeyInfo& keyInfo) const {
  if (!keyInfo.issuerSerials.empty()) {
    return KeysOf(SelectByIssuerSerials(keyInfo.issuerSerials));
  }
  if (keyInfo.certificates.empty()) {
    return {};
  }
  const Bytes& der = keyInfo.certificates.front();
  try {
    const auto certificate = Crypto::CreateCertificateFromDer(der.data(), der.size());
    return KeysOf(SelectByIssuerOf(dynamic_cast<const CertificateImpl&>(*certificate)));
  } catch (const Crypto::CryptoException&) {
    return {};  // an unreadable certificate names no issuer
  }
}

template <class Matches>
TrustedCertificates::Selection TrustedCertificates::Select(Matches matches) const {
  Selection selection;
  for (const Trusted& trusted : list_) {
    if (matches(trusted)) {
      selection.push_back(&trusted);
    }
  }
  return selection;
}

// KeyInfo may contain a chain with several trusted certificates; by convention the signer's comes
// first.
TrustedCertificates::Selection TrustedCertificates::SelectByCertificates(
    const std::vector<Bytes>& encodings) const {
  for (const Bytes& der : FirstOf(encodings)) {
    for (const Trusted& trusted : list_) {
      const Certificate& certificate = *trusted.certificate;
      if (certificate.DerLength() == der.size() &&
          std::memcmp(certificate.DerBytes(), der.data(), der.size()) == 0) {
        return {&trusted};
      }
    }
  }
  return {};
}

TrustedCertificates::Selection TrustedCertificates::SelectByIssuerSerials(
    const std::vector<KeyInfo::IssuerSerial>& hints) const {
  struct Parsed {
    NameHint issuer;
    std::string_view serialNumber;
  };
  std::vector<Parsed> parsed;
  for (const KeyInfo::IssuerSerial& hint : FirstOf(hints)) {
    parsed.push_back({NameHint(hint.issuerName), WithoutLeadingZeros(hint.serialNumber)});
  }
  return Select([&parsed](const Trusted& trusted) {
    const Certificate& certificate = *trusted.certificate;
    return AnyOf(parsed, [&](Parsed& hint) {
      return hint.serialNumber == WithoutLeadingZeros(certificate.SerialNumber()) &&
             hint.issuer.Names(certificate.IssuerName(), IssuerOf(trusted.decoded.get()));
    });
  });
}

TrustedCertificates::Selection TrustedCertificates::SelectByIssuerOf(
    const CertificateImpl& certificate) const {
  return Select([&certificate](const Trusted& trusted) {
    return trusted.decoded != nullptr &&
           trusted.decoded->SerialNumber() == certificate.SerialNumber() &&
           trusted.decoded->Issuer().Equals(certificate.Issuer());
  });
}

TrustedCertificates::Selection TrustedCertificates::SelectBySubjectNames(
    const std::vector<std::string>& hints) const {
  std::vector<NameHint> names;
  for (const std::string& hint : FirstOf(hints)) {
    names.emplace_back(hint);
  }
  return Select([&names](const Trusted& trusted) {
    return AnyOf(names, [&trusted](NameHint& name) {
      return name.Names(trusted.certificate->SubjectName(), SubjectOf(trusted.decoded.get()));
    });
  });
}

// An empty identifier names nothing, although a certificate may have none.
TrustedCertificates::Selection TrustedCertificates::SelectByKeyIdentifiers(
    const std::vector<Bytes>& hints) const {
  return Select([hints = FirstOf(hints)](const Trusted& trusted) {
    return trusted.decoded != nullptr && AnyOf(hints, [&trusted](const Bytes& identifier) {
             return !identifier.empty() && identifier == trusted.decoded->KeyIdentifier();
           });
  });
}

TrustedCertificates::Selection TrustedCertificates::SelectByDigests(const KeyHints& hints) const {
  Selection selection;
  std::vector<bool> isSelected(list_.size());
  for (const SupportedDigest& hint : SupportedDigestsIn(hints)) {
    const auto digests = DigestsOfAll(hint.hash);
    for (std::size_t i = 0; i < list_.size(); ++i) {
      if ((*digests)[i] == *hint.value && !isSelected[i]) {
        isSelected[i] = true;
        selection.push_back(&list_[i]);
      }
    }
  }
  return selection;
}

// A hint that cannot be read is empty, and so is the identity of a key of an unknown kind.
TrustedCertificates::Selection TrustedCertificates::SelectByPublicKeys(
    const std::vector<Bytes>& hints) const {
  return Select([hints = FirstOf(hints)](const Trusted& trusted) {
    return trusted.decoded != nullptr && AnyOf(hints, [&trusted](const Bytes& key) {
             return !key.empty() &&
                    (key == trusted.identity || key == trusted.decoded->SubjectPublicKeyInfo());
           });
  });
}

std::shared_ptr<const std::vector<Bytes>> TrustedCertificates::DigestsOfAll(
    Crypto::Hash hash) const {
  std::shared_ptr<const std::vector<Bytes>>& known = digests_[static_cast<std::size_t>(hash)];
  {
    const std::lock_guard lock(ObjectLock(this));
    if (known != nullptr) {
      return known;
    }
  }
  auto digests = std::make_shared<std::vector<Bytes>>();
  for (const Trusted& trusted : list_) {
    digests->push_back(
        Crypto::HashOf(hash, trusted.certificate->DerBytes(), trusted.certificate->DerLength()));
  }
  const std::lock_guard lock(ObjectLock(this));
  known = digests;
  return digests;
}

TrustedCertificates::Keys TrustedCertificates::KeysOf(const Selection& selection) const {
  if (selection.size() == 1) {
    return {selection.front()->certificate->GetPublicKey()};
  }
  Keys keys;
  std::vector<bool> isTaken(keys_.size());
  for (const Trusted* trusted : selection) {
    if (trusted->key != kNoKey && !isTaken[trusted->key]) {
      isTaken[trusted->key] = true;
      keys.push_back(keys_[trusted->key]);
    }
  }
  return keys;
}

}  // namespace Tarnik::Xml::Security
