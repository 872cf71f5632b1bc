#ifndef DEVSTS_WIRE_TLS_CONTEXT_H
#define DEVSTS_WIRE_TLS_CONTEXT_H

#include "devsts/server.h"
#include "signing/openssl_handles.h"

namespace DevSts {

// The server's certificate and the rest of its chain.
struct ServerIdentity {
  Credential credential;
  std::string chainPem;  // the intermediate certificate that is sent, or empty
};

ServerIdentity MakeServerIdentity(const TlsOptions& options, const Credential& authority);

SslContextHandle MakeTlsContext(const TlsOptions& options, const ServerIdentity& identity,
                                const Credential& authority);

}  // namespace DevSts

#endif
