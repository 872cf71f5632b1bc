#include "trust/trust_snapshot.h"

#include <set>
#include <utility>

#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>

namespace SsoClient::Access {

namespace {

using Certificates = std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>>;

// The signers with the certificates, which are the objects that the resolver was given.
std::vector<const Signer*> SignersWith(const Certificates& certificates,
                                       const std::vector<Signer>& signers) {
  std::set<const Tarnik::Crypto::Certificate*> wanted;
  for (const auto& certificate : certificates) {
    wanted.insert(certificate.get());
  }
  std::vector<const Signer*> found;
  for (const Signer& signer : signers) {
    if (wanted.count(signer.certificate.get()) != 0) {
      found.push_back(&signer);
    }
  }
  return found;
}

// By the URI of a signature method (RFC 6931, section 2.3).
bool HasKeyFor(std::string_view method, const Tarnik::Crypto::Certificate& certificate) {
  const bool isForEc = method.find("#ecdsa-") != std::string_view::npos;
  return isForEc == (certificate.GetPublicKey()->Algorithm() == Tarnik::Crypto::KeyAlgorithm::kEc);
}

}  // namespace

std::vector<const Signer*> IssuerTrust::Select(const Tarnik::Xml::Security::KeyInfo& keyInfo,
                                               std::string_view method) const {
  if (resolver == nullptr) {
    return {};
  }
  auto candidates = resolver->CandidateCertificates(keyInfo);
  if (candidates.size() > kMostTried) {
    std::erase_if(candidates,
                  [method](const auto& certificate) { return !HasKeyFor(method, *certificate); });
  }
  return SignersWith(candidates, signers);
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
