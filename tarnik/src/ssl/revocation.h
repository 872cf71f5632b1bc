#ifndef TARNIK_SSL_REVOCATION_H
#define TARNIK_SSL_REVOCATION_H

#include "support/openssl.h"

namespace Tarnik::Ssl {

/// Makes `store` check each certificate of a chain against the revocation lists of its issuer. The
/// newest list counts, and when several lists have its date, all of them (see `SSLContextConfig`).
void CheckRevocation(X509_STORE* store);

}  // namespace Tarnik::Ssl

#endif
