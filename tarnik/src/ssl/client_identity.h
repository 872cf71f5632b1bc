#ifndef TARNIK_SSL_CLIENT_IDENTITY_H
#define TARNIK_SSL_CLIENT_IDENTITY_H

#include <tarnik/ssl/ssl_context.h>

#include "support/openssl.h"

namespace Tarnik::Ssl {

/// Sets the client's certificate and key of `config`, if any, in `context`. Throws as
/// `CreateSSLContext` does.
void LoadClientIdentity(const SSLContextConfig& config, SSL_CTX* context);

}  // namespace Tarnik::Ssl

#endif
