#ifndef FUZZ_CLIENT_PKI_H
#define FUZZ_CLIENT_PKI_H

#include <string>
#include <vector>

#include "support/test_pki.h"

namespace Fuzz {

/// The certificates and revocation lists that the lines of an input name.
struct NamedCertificate {
  std::string name;
  /// Of the certificate itself if it is self-signed.
  std::string issuer;
  bool isExpired = false;
  Tarnik::Testing::Identity identity;
};

struct NamedList {
  std::string name;
  std::string issuer;
  /// The certificate that it revokes, if any.
  std::string revoked;
  bool isOutdated = false;
  std::string pem;
};

/// "root", "other", "intermediate", and the ends "direct", "indirect", "stranger", "expired",
/// "weak". Null for another word.
const NamedCertificate* FindCertificate(const std::string& name);
/// "root-list", "root-revokes", "root-outdated", "intermediate-list", "intermediate-revokes",
/// "other-list". All are of the same date. Null for another word.
const NamedList* FindList(const std::string& name);
/// From an end to a self-signed certificate.
std::vector<const NamedCertificate*> ChainOf(const std::string& name);

/// A text for a PEM file: a certificate, a list, "text", "key" or "broken". Empty for another word.
std::string PartOf(const std::string& word);
std::string DerOfRoot();
/// PKCS#8.
std::string KeyOf(const NamedCertificate& certificate);

/// The names and addresses of every end.
inline constexpr const char* kServerHost = "sts.example";
inline constexpr const char* kServerAddress = "192.0.2.7";
inline constexpr const char* kServerLongAddress = "2001:db8::7";

}  // namespace Fuzz

#endif
