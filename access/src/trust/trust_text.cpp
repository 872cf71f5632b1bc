#include "trust/trust_text.h"

#include <algorithm>
#include <cstddef>

#include <ssoclient/access/trust_store.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/text/display_text.h>

namespace SsoClient::Access {

namespace {

constexpr std::size_t kLongestText = 500;

std::string ForPeople(const std::string& text) {
  return Tarnik::ToDisplayText(text, kLongestText);
}

std::string RevocationOf(const TrustedSigner& signer) {
  if (signer.revokedSince) {
    return "revoked since " + signer.revokedSince->ToString();
  }
  if (!signer.isRevocationChecked) {
    return "revocation not checked";
  }
  return signer.listUntil ? "not revoked, by a list until " + signer.listUntil->ToString()
                          : "refused, since no revocation list covers it";
}

std::string TextOf(const TrustedSigner& signer) {
  const Tarnik::Crypto::Certificate& certificate = *signer.certificate;
  return IssuerText(signer.issuer) + ": " + ForPeople(certificate.SubjectName()) +
         ", serial number " + ForPeople(certificate.SerialNumber()) + ", " +
         (signer.path.empty() ? "given as an object" : "from '" + ForPeople(signer.path) + "'") +
         "\n  valid from " + certificate.NotBefore().ToString() + " to " +
         certificate.NotAfter().ToString() + ", " + RevocationOf(signer) + ", SHA-256 " +
         Tarnik::Crypto::FingerprintText(certificate) + "\n";
}

std::string TextOfIssuerWithoutSigners(const std::string& issuer, bool hasSignersOfAny) {
  return IssuerText(issuer) + (hasSignersOfAny ? ": only the signers of any issuer are trusted\n"
                                               : ": nobody is trusted\n");
}

}  // namespace

std::string IssuerText(const std::string& issuer) {
  return issuer.empty() ? "any issuer" : "'" + ForPeople(issuer) + "'";
}

std::string TrustDescription::ToString() const {
  std::string text = "Trust read at " + loadedAt.ToString() + ", " +
                     std::to_string(signers.size()) +
                     (signers.size() == 1 ? " signer\n" : " signers\n");
  if (!failure.empty()) {
    text += "The files as they are now were not accepted: " + ForPeople(failure) + "\n";
  }
  for (const TrustedSigner& signer : signers) {
    text += TextOf(signer);
  }
  const bool hasSignersOfAny =
      std::any_of(signers.begin(), signers.end(),
                  [](const TrustedSigner& signer) { return signer.issuer.empty(); });
  for (const std::string& issuer : issuersWithoutSigners) {
    text += TextOfIssuerWithoutSigners(issuer, hasSignersOfAny);
  }
  return text;
}

}  // namespace SsoClient::Access
