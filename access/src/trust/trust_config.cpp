#include "trust/trust_config.h"

#include <algorithm>
#include <cstddef>
#include <filesystem>
#include <string>
#include <system_error>
#include <vector>

#include <tarnik/core/exception.h>
#include <tarnik/text/display_text.h>

#include "require.h"
#include "trust/trust_text.h"

namespace SsoClient::Access {

namespace {

constexpr std::size_t kLongestPath = 200;

// "entry issuers[1] ('https://b') of the trust store"
std::string EntryText(const TrustedIssuer& entry, std::size_t index) {
  const bool isNameless = entry.issuer.empty() && !entry.isForAnyIssuer;
  return "entry issuers[" + std::to_string(index) + "]" +
         (isNameless ? "" : " (" + IssuerText(entry.issuer) + ")") + " of the trust store";
}

void CheckPaths(const std::vector<std::string>& paths, const char* member,
                const std::string& entry) {
  for (std::size_t i = 0; i < paths.size(); ++i) {
    const std::string name = std::string(member) + "[" + std::to_string(i) + "] of the " + entry;
    Require(!paths[i].empty(), "The path " + name + " is empty.");
    Require(paths[i].find('\0') == std::string::npos,
            "The path " + name + " contains a NUL: '" +
                Tarnik::ToDisplayText(paths[i], kLongestPath) + "'.");
  }
}

// An entry without an issuer is for any: that has to be said, since it may have been forgotten.
void CheckName(const TrustedIssuer& entry, const std::string& name) {
  Require(entry.isForAnyIssuer || !entry.issuer.empty(),
          "The " + name + " names no issuer and is not for any issuer.");
  Require(!entry.isForAnyIssuer || entry.issuer.empty(),
          "The " + name + " names an issuer and is for any issuer.");
}

void CheckEntry(const TrustedIssuer& entry, const std::string& name) {
  CheckName(entry, name);
  Require(!entry.certificates.empty() || !entry.certificatePaths.empty(),
          "The " + name + " has neither a certificate nor a path of one.");
  const auto null = std::find(entry.certificates.begin(), entry.certificates.end(), nullptr);
  Require(null == entry.certificates.end(), "The certificate certificates[" +
                                                std::to_string(null - entry.certificates.begin()) +
                                                "] of the " + name + " is null.");
  Require(entry.listSignerPaths.empty() || !entry.revocationListPaths.empty(),
          "The " + name + " has signers of revocation lists, but no path of a list.");
  CheckPaths(entry.certificatePaths, "certificatePaths", name);
  CheckPaths(entry.revocationListPaths, "revocationListPaths", name);
  CheckPaths(entry.listSignerPaths, "listSignerPaths", name);
}

void MakeAbsolute(std::vector<std::string>& paths) {
  for (std::string& path : paths) {
    std::error_code error;
    const auto absolute = std::filesystem::absolute(path, error);
    if (error) {
      throw Tarnik::IOException("The current folder is unknown, to which the path '" + path +
                                "' of the trust store is relative: " + error.message() + ".");
    }
    path = absolute.string();
  }
}

}  // namespace

void CheckTrustConfig(const TrustStoreConfig& config) {
  Require(!config.issuers.empty(), "The trust store has no entry.");
  for (std::size_t i = 0; i < config.issuers.size(); ++i) {
    CheckEntry(config.issuers[i], EntryText(config.issuers[i], i));
  }
}

void ThrowNoCertificate(const TrustStoreConfig& config) {
  std::string text;
  for (std::size_t i = 0; i < config.issuers.size(); ++i) {
    const TrustedIssuer& entry = config.issuers[i];
    for (const std::string& path : entry.certificatePaths) {
      text += (text.empty() ? "'" : ", '") + path + "' (issuers[" + std::to_string(i) + "], " +
              IssuerText(entry.issuer) + ")";
    }
  }
  throw Tarnik::InvalidArgumentException(
      "The trust store has no certificate. Its entries contain none in " + text + ".");
}

void MakePathsAbsolute(TrustStoreConfig& config) {
  for (TrustedIssuer& issuer : config.issuers) {
    MakeAbsolute(issuer.certificatePaths);
    MakeAbsolute(issuer.revocationListPaths);
    MakeAbsolute(issuer.listSignerPaths);
  }
}

}  // namespace SsoClient::Access
