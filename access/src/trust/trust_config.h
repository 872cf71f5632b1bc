#ifndef SSOCLIENT_ACCESS_TRUST_TRUST_CONFIG_H
#define SSOCLIENT_ACCESS_TRUST_TRUST_CONFIG_H

#include <ssoclient/access/trust_store.h>

namespace SsoClient::Access {

/// Throws `Tarnik::InvalidArgumentException` for a configuration that `CreateTrustStore` refuses
/// without looking at files.
void CheckTrustConfig(const TrustStoreConfig& config);

/// Throws `Tarnik::InvalidArgumentException` for entries whose folders contain no certificate.
[[noreturn]] void ThrowNoCertificate(const TrustStoreConfig& config);

/// Makes all paths absolute, so that they stay the same when the process changes its folder.
/// Throws `Tarnik::IOException` when the current folder is unknown.
void MakePathsAbsolute(TrustStoreConfig& config);

}  // namespace SsoClient::Access

#endif
