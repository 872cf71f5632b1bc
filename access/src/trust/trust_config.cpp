#include "trust/trust_config.h"

#include <algorithm>
#include <filesystem>
#include <string>
#include <system_error>
#include <vector>

#include <tarnik/core/exception.h>

namespace SsoClient::Access {

namespace {

void RequireTrust(bool condition, const char* message) {
  if (!condition) {
    throw Tarnik::InvalidArgumentException(message);
  }
}

void CheckPaths(const std::vector<std::string>& paths) {
  for (const std::string& path : paths) {
    RequireTrust(!path.empty(), "A path of the trust store is empty.");
    RequireTrust(path.find('\0') == std::string::npos, "A path of the trust store contains a NUL.");
  }
}

// An entry without an issuer is for any: that has to be said, since it may have been forgotten.
void CheckName(const TrustedIssuer& issuer) {
  RequireTrust(issuer.isForAnyIssuer || !issuer.issuer.empty(),
               "An entry of the trust store names no issuer and is not for any issuer.");
  RequireTrust(!issuer.isForAnyIssuer || issuer.issuer.empty(),
               "An entry of the trust store names an issuer and is for any issuer.");
}

void CheckIssuer(const TrustedIssuer& issuer) {
  CheckName(issuer);
  RequireTrust(!issuer.certificates.empty() || !issuer.certificatePaths.empty(),
               "An issuer of the trust store has neither a certificate nor a path of one.");
  RequireTrust(std::find(issuer.certificates.begin(), issuer.certificates.end(), nullptr) ==
                   issuer.certificates.end(),
               "A certificate of the trust store is null.");
  RequireTrust(issuer.listSignerPaths.empty() || !issuer.revocationListPaths.empty(),
               "An issuer of the trust store has signers of revocation lists, but no path of one.");
  CheckPaths(issuer.certificatePaths);
  CheckPaths(issuer.revocationListPaths);
  CheckPaths(issuer.listSignerPaths);
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
  RequireTrust(!config.issuers.empty(), "The trust store has no issuer.");
  for (const TrustedIssuer& issuer : config.issuers) {
    CheckIssuer(issuer);
  }
}

void MakePathsAbsolute(TrustStoreConfig& config) {
  for (TrustedIssuer& issuer : config.issuers) {
    MakeAbsolute(issuer.certificatePaths);
    MakeAbsolute(issuer.revocationListPaths);
    MakeAbsolute(issuer.listSignerPaths);
  }
}

}  // namespace SsoClient::Access
