#ifndef TARNIK_SSL_TRUST_STORE_H
#define TARNIK_SSL_TRUST_STORE_H

#include <tarnik/ssl/ssl_context.h>

#include "support/openssl.h"

namespace Tarnik::Ssl {

/// Fills `store` with the CAs and revocation lists that `config` names, and turns revocation checks
/// on if there are lists. Throws `SSLException`, naming the file or folder that cannot be loaded.
void LoadTrust(const SSLContextConfig& config, X509_STORE* store);

}  // namespace Tarnik::Ssl

#endif
