#include "trust/trust_builder.h"

#include <algorithm>
#include <atomic>
#include <cstddef>
#include <map>
#include <optional>
#include <string_view>
#include <utility>

#include <boost/smart_ptr/intrusive_ptr.hpp>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/revocation_list.h>
#include <tarnik/system/date_time.h>
#include <tarnik/text/display_text.h>

#include "certificate_text.h"
#include "trust/trust_entry.h"

namespace SsoClient::Access {

namespace {

using Tarnik::Ref;
using Tarnik::Crypto::Certificate;
using Tarnik::Crypto::RevocationList;
using Tarnik::Crypto::Sha256Digest;
using Tarnik::System::DateTime;
using Tarnik::Xml::Security::CertificateCandidatesResolver;

constexpr std::size_t kLongestSubject = 200;

std::uint64_t NextVersion() noexcept {
  static std::atomic<std::uint64_t> last{0};
  return last.fetch_add(1, std::memory_order_relaxed) + 1;
}

Signer MakeSigner(const Ref<const Certificate>& certificate) {
  Signer signer;
  signer.certificate = certificate;
  signer.notBefore = certificate->NotBefore();
  signer.notAfter = certificate->NotAfter();
  signer.resolver = Tarnik::Xml::Security::CreateTrustedCertificatesResolver({certificate});
  signer.name = Tarnik::ToDisplayText(certificate->SubjectName(), kLongestSubject) + " (SHA-256 " +
                ShortFingerprint(*certificate) + ")";
  return signer;
}

/// What the lists of one list signer say about a certificate.
struct ListedState {
  DateTime from;
  DateTime until;
  std::optional<DateTime> revokedSince;
};

// By the fingerprints of the list signers.
using ListedStates = std::map<Sha256Digest, ListedState>;

// Of several lists of one list signer the latest one counts; of several of one date, all of them.
void Consider(const TrustEntry::FoundList& found, const Certificate& certificate,
              ListedStates& states) {
  const RevocationList& list = *found.list;
  if (!list.Covers(certificate)) {
    return;
  }
  const auto from = list.ThisUpdate();
  const auto [place, isNew] = states.try_emplace(found.signer);
  ListedState& state = place->second;
  if (!isNew && from < state.from) {
    return;
  }
  if (isNew || state.from < from) {
    state = {from, list.NextUpdate(), std::nullopt};
  }
  state.until = std::min(state.until, list.NextUpdate());
  if (const auto since = list.RevokedSince(certificate)) {
    state.revokedSince = state.revokedSince ? std::min(*state.revokedSince, *since) : *since;
  }
}

// An authority that has changed its key may list what it has issued before by the old key only. So
// a certificate is revoked if the lists of any list signer say so; the latest ones give the period.
void Combine(const ListedStates& states, Signer& signer) {
  for (const auto& [digest, state] : states) {
    if (!signer.listFrom || *signer.listFrom <= state.from) {
      const bool isSame = signer.listFrom && *signer.listFrom == state.from;
      signer.listUntil = isSame ? std::min(*signer.listUntil, state.until) : state.until;
      signer.listFrom = state.from;
    }
    if (state.revokedSince) {
      signer.revokedSince = signer.revokedSince
                                ? std::min(*signer.revokedSince, *state.revokedSince)
                                : *state.revokedSince;
    }
  }
}

// The signers of one issuer; those of its own entries come first.
struct BuiltIssuer {
  IssuerTrust trust;
  std::vector<std::string> ownPaths;  // `TrustedSigner::path` of its own signers
};

class IssuerBuilder {
 public:
  void Add(const TrustEntry& entry, bool isOwn) {
    for (const TrustEntry::Found& found : entry.certificates) {
      const auto digest = Tarnik::Crypto::Fingerprint(*found.certificate);
      const auto [place, isNew] = places_.try_emplace(digest, built_.trust.signers.size());
      if (isNew) {
        states_.emplace_back();
        built_.trust.signers.push_back(MakeSigner(found.certificate));
        if (isOwn) {
          built_.ownPaths.push_back(found.path);
        }
      }
      Signer& signer = built_.trust.signers[place->second];
      signer.isRevocationChecked = signer.isRevocationChecked || entry.isRevocationChecked;
      for (const TrustEntry::FoundList& list : entry.lists) {
        Consider(list, *signer.certificate, states_[place->second]);
      }
    }
  }

  BuiltIssuer Build() {
    IssuerTrust& trust = built_.trust;
    for (std::size_t i = 0; i < states_.size(); ++i) {
      Combine(states_[i], trust.signers[i]);
    }
    if (!trust.signers.empty()) {
      std::vector<Ref<const Certificate>> certificates;
      certificates.reserve(trust.signers.size());
      for (const Signer& signer : trust.signers) {
        certificates.push_back(signer.certificate);
      }
      trust.resolver = boost::dynamic_pointer_cast<const CertificateCandidatesResolver>(
          Tarnik::Xml::Security::CreateTrustedCertificatesResolver(std::move(certificates)));
    }
    return std::move(built_);
  }

 private:
  BuiltIssuer built_;
  std::map<Sha256Digest, std::size_t> places_;
  std::vector<ListedStates> states_;  // of the signers
};

BuiltIssuer BuildIssuer(const std::vector<TrustEntry>& entries, std::string_view issuer) {
  IssuerBuilder builder;
  for (const TrustEntry& entry : entries) {
    if (entry.issuer == issuer) {
      builder.Add(entry, true);
    }
  }
  for (const TrustEntry& entry : entries) {
    if (entry.issuer.empty() && !issuer.empty()) {
      builder.Add(entry, false);
    }
  }
  return builder.Build();
}

// Appends the issuer's own signers to `described`.
void Describe(const std::string& issuer, const BuiltIssuer& built,
              std::vector<TrustedSigner>& described) {
  for (std::size_t i = 0; i < built.ownPaths.size(); ++i) {
    const Signer& signer = built.trust.signers[i];
    TrustedSigner& entry = described.emplace_back();
    entry.issuer = issuer;
    entry.certificate = signer.certificate;
    entry.path = built.ownPaths[i];
    entry.isRevocationChecked = signer.isRevocationChecked;
    if (signer.revokedSince) {
      entry.revokedSince = *signer.revokedSince;
    }
    if (signer.listUntil) {
      entry.listUntil = *signer.listUntil;
    }
  }
}

std::set<std::pair<std::string, Sha256Digest>> IdentitiesOf(
    const std::vector<TrustedSigner>& signers) {
  std::set<std::pair<std::string, Sha256Digest>> identities;
  for (const TrustedSigner& signer : signers) {
    identities.emplace(signer.issuer, Tarnik::Crypto::Fingerprint(*signer.certificate));
  }
  return identities;
}

}  // namespace

std::shared_ptr<const Trust> BuildTrust(const std::vector<TrustedIssuer>& issuers,
                                        const TrustContents& contents) {
  std::vector<TrustEntry> entries;
  entries.reserve(issuers.size());
  for (std::size_t i = 0; i < issuers.size(); ++i) {
    entries.push_back(DecodeEntry(issuers[i], contents.entries[i]));
  }
  std::vector<TrustedSigner> signers;
  std::vector<std::string> withoutSigners;
  std::map<std::string, IssuerTrust, std::less<>> named;
  IssuerTrust others;
  std::set<std::string_view> done;
  for (const TrustEntry& entry : entries) {
    if (done.insert(entry.issuer).second) {
      BuiltIssuer built = BuildIssuer(entries, entry.issuer);
      Describe(entry.issuer, built, signers);
      if (built.ownPaths.empty()) {
        withoutSigners.push_back(entry.issuer);
      }
      (entry.issuer.empty() ? others : named[entry.issuer]) = std::move(built.trust);
    }
  }
  TrustSnapshot snapshot(std::move(named), std::move(others), NextVersion());
  auto identities = IdentitiesOf(signers);
  return std::make_shared<const Trust>(Trust{std::move(snapshot), std::move(signers),
                                             std::move(withoutSigners), std::move(identities),
                                             contents.digest});
}

}  // namespace SsoClient::Access
