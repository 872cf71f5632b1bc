#include <algorithm>
#include <initializer_list>

#include <openssl/x509_vfy.h>

#include "doctor/chain.h"
#include "doctor/local_files.h"
#include "output/count_text.h"

namespace SsoClient::Tool::Doctor {
namespace {

bool HasAny(const ChainFacts& facts, std::initializer_list<int> errors) {
  return std::any_of(errors.begin(), errors.end(),
                     [&](int error) { return facts.errors.count(error) != 0; });
}

Finding Untrusted(FindingName name, std::string message, std::string remedy) {
  return Failure(ExitStatus::kUnreachable, name, std::move(message), std::move(remedy));
}

// `link` is one of the links.
std::string RenewalRemedy(const ChainFacts& facts, const ChainLink& link) {
  if (&link == &facts.links.front()) {
    return "have the certificate of the service renewed";
  }
  return link.isSelfIssued
             ? "get the next certificate of the CA from a trusted source, and give it as --ca too"
             : "get the next certificate of the CA, and let the service send it";
}

Finding UnknownIssuer(const ChainFacts& facts) {
  const ChainLink& last = facts.links.back();
  const std::string needed = last.issuer;
  if (facts.isIssuerNameTrusted) {
    return Untrusted(
        "ca-replaced",
        "a trusted CA is called " + needed + ", but the certificate was issued with another key",
        "give --ca the current certificate of " + needed);
  }
  if (facts.links.size() == 1 && last.isSelfIssued) {
    return Untrusted("self-signed", "the certificate of the service is self-signed",
                     "have it issued by a CA, or check its fingerprint and give it as --ca");
  }
  if (last.isSelfIssued || facts.links.size() > 1) {
    return Untrusted("unknown-ca", "the CA " + needed + " of the service is not trusted",
                     "get the certificate of " + needed +
                         " from a trusted source, and give it "
                         "as --ca");
  }
  // From outside, a root that is not trusted and an intermediate that is not sent look the same.
  return Untrusted(
      "unknown-issuer",
      "the issuer " + needed + " is not trusted, and the service does not send its certificate",
      "if it is a root CA, give its certificate as --ca; if it is an intermediate "
      "CA, let the service send its certificate");
}

Finding WrongName(const ChainFacts& facts) {
  std::string names;
  for (const std::string& name : facts.links.front().names) {
    names += (names.empty() ? "" : ", ") + name;
  }
  const bool hasNames = !names.empty();
  return Untrusted("wrong-name",
                   "the certificate is not for " + facts.expectedName + ", but for " +
                       (hasNames ? names : "no name: it has no subjectAltName"),
                   hasNames ? "use one of these names in the URL, or give it as --peer-name"
                            : "have a certificate with a subjectAltName issued");
}

Finding OutOfDate(const ChainFacts& facts, const Tarnik::System::DateTime& now) {
  for (const ChainLink& link : facts.links) {
    if (link.notAfter <= now) {
      return Untrusted("expired",
                       "the certificate of " + link.subject + " has expired on " +
                           link.notAfter.ToString() + "; it is now " + now.ToString(),
                       RenewalRemedy(facts, link) + ", unless the clock of this machine is wrong");
    }
    if (link.notBefore > now) {
      return Untrusted("not-yet-valid",
                       "the certificate of " + link.subject + " is valid only from " +
                           link.notBefore.ToString() + "; it is now " + now.ToString(),
                       "check the clock of this machine, or wait");
    }
  }
  return Untrusted("expired", "a trusted CA of the chain is not valid now",
                   "renew the file of "
                   "--ca");
}

Finding FindingOfErrors(const ChainFacts& facts, const Tarnik::System::DateTime& now) {
  if (HasAny(facts, {X509_V_ERR_CERT_REVOKED})) {
    return Untrusted("revoked", "a certificate of the chain is revoked",
                     "have a new certificate issued for the service");
  }
  if (HasAny(facts, {X509_V_ERR_CERT_HAS_EXPIRED, X509_V_ERR_CERT_NOT_YET_VALID})) {
    return OutOfDate(facts, now);
  }
  if (HasAny(facts,
             {X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT, X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT_LOCALLY,
              X509_V_ERR_UNABLE_TO_VERIFY_LEAF_SIGNATURE, X509_V_ERR_DEPTH_ZERO_SELF_SIGNED_CERT,
              X509_V_ERR_SELF_SIGNED_CERT_IN_CHAIN, X509_V_ERR_CERT_SIGNATURE_FAILURE})) {
    return UnknownIssuer(facts);
  }
  if (HasAny(facts, {X509_V_ERR_HOSTNAME_MISMATCH, X509_V_ERR_IP_ADDRESS_MISMATCH})) {
    return WrongName(facts);
  }
  const std::string reason = X509_verify_cert_error_string(*facts.errors.begin());
  if (HasAny(facts, {X509_V_ERR_UNABLE_TO_GET_CRL, X509_V_ERR_CRL_HAS_EXPIRED,
                     X509_V_ERR_CRL_NOT_YET_VALID, X509_V_ERR_CRL_SIGNATURE_FAILURE})) {
    return Untrusted("revocation-unknown",
                     "it cannot be determined whether the chain is revoked: " + reason,
                     "give a current list of each CA of the chain as --tls-crl");
  }
  return Untrusted("not-trusted", "the chain is not accepted: " + reason,
                   "have a certificate for TLS servers with a strong key issued");
}

}  // namespace

Finding FindingOfChain(const ChainFacts& facts, const Tarnik::System::DateTime& now) {
  if (!facts.errors.empty()) {
    return FindingOfErrors(facts, now);
  }
  for (const ChainLink& link : facts.links) {
    const long days = DaysUntil(link.notAfter, now);
    if (days < kSoonDays) {
      return Warning(ExitStatus::kUnreachable, "expires-soon",
                     "the certificate of " + link.subject + " expires in " +
                         CountText(days, "day") + ", on " + link.notAfter.ToString(),
                     RenewalRemedy(facts, link));
    }
  }
  return Fine("trusted for " + facts.expectedName + ", valid until " +
              facts.links.front().notAfter.ToString());
}

}  // namespace SsoClient::Tool::Doctor
