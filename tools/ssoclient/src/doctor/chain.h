#ifndef SSOCLIENT_TOOL_DOCTOR_CHAIN_H
#define SSOCLIENT_TOOL_DOCTOR_CHAIN_H

#include <set>
#include <string>
#include <vector>

#include <openssl/x509.h>

#include <tarnik/system/date_time.h>

#include "doctor/report.h"
#include "doctor/tls_probe.h"

namespace SsoClient::Tool::Doctor {

/// A certificate of a chain.
struct ChainLink {
  std::string subject{};
  std::string issuer{};
  std::string fingerprint{};
  std::vector<std::string> names{};  ///< the alternative names: DNS names and addresses
  Tarnik::System::DateTime notBefore{};
  Tarnik::System::DateTime notAfter{};
  bool isSelfIssued = false;  ///< subject and issuer are equal
};

ChainLink Describe(const X509& certificate);

/// What OpenSSL says about a chain.
struct ChainFacts {
  std::vector<ChainLink> links{};  ///< as sent, the service's own first
  /// The errors of the verification (X509_V_ERR_...), empty if it is valid.
  std::set<int> errors{};
  std::string expectedName{};
  /// A trusted CA has the name of the last link's issuer, but did not sign it.
  bool isIssuerNameTrusted = false;
};

/// Whom to trust, as in the options of the connection.
struct ChainTrust {
  std::vector<std::string> caFiles{};  ///< the system's CAs if empty
  std::vector<std::string> crlFiles{};
};

/// Verifies the chain of at least one certificate for a TLS server of that name, now. Throws
/// `std::runtime_error` when the files cannot be loaded.
ChainFacts Verify(const std::vector<OwnedX509>& chain, const ChainTrust& trust,
                  const std::string& expectedName);

/// What that means at `now`.
Finding FindingOfChain(const ChainFacts& facts, const Tarnik::System::DateTime& now);

}  // namespace SsoClient::Tool::Doctor

#endif
