#include "trust/trust_snapshot.h"

#include <algorithm>
#include <utility>

#include <tarnik/crypto/certificate.h>

namespace SsoClient::Access {

namespace {

constexpr std::size_t kMostCandidates = 16;

const Signer* FindCertificate(const std::vector<Signer>& signers,
                              const Tarnik::Crypto::Certificate& certificate) {
  // The resolver returns the objects that it was given.
  const auto found = std::find_if(
      signers.begin(), signers.end(),
      [&certificate](const Signer& signer) { return signer.certificate.get() == &certificate; });
  return found == signers.end() ? nullptr : &*found;
}

// By the URI of a signature method (RFC 6931, section 2.3).
bool HasKeyFor(std::string_view method, const Tarnik::Crypto::Certificate& certificate) {
  const bool isForEc = method.find("#ecdsa-") != std::string_view::npos;
  return isForEc == (certificate.GetPublicKey()->Algorithm() == Tarnik::Crypto::KeyAlgorithm::kEc);
}

}  // namespace

std::vector<const Signer*> IssuerTrust::Select(const Tarnik::Xml::Security::KeyInfo& keyInfo,
                                               std::string_view method) const {
  std::vector<const Signer*> selected;
  if (resolver == nullptr) {
    return selected;
  }
  auto candidates = resolver->CandidateCertificates(keyInfo);
  if (candidates.size() > kMostCandidates) {
    std::erase_if(candidates,
                  [method](const auto& certificate) { return !HasKeyFor(method, *certificate); });
  }
  for (const auto& certificate : candidates) {
    if (selected.size() == kMostCandidates) {
      break;
    }
    if (const Signer* const signer = FindCertificate(signers, *certificate)) {
      selected.push_back(signer);
    }
  }
  return selected;
}

TrustSnapshot::TrustSnapshot(std::map<std::string, IssuerTrust, std::less<>> named,
                             IssuerTrust others, std::uint64_t version)
    : named_(std::move(named)), others_(std::move(others)), version_(version) {}

const IssuerTrust* TrustSnapshot::Find(std::string_view issuer) const {
  const auto found = named_.find(issuer);
  const IssuerTrust& trust = found == named_.end() ? others_ : found->second;
  return trust.signers.empty() ? nullptr : &trust;
}

std::vector<std::string_view> TrustSnapshot::Issuers() const {
  std::vector<std::string_view> issuers;
  for (const auto& [issuer, trust] : named_) {
    if (!trust.signers.empty()) {
      issuers.push_back(issuer);
    }
  }
  return issuers;
}

}  // namespace SsoClient::Access
