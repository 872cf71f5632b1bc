#ifndef DEVSTS_WIRE_TLS_CONTEXT_H
#define DEVSTS_WIRE_TLS_CONTEXT_H

#include "devsts/server.h"
#include "signing/openssl_handles.h"

namespace DevSts {

// The server's certificate and what is sent along with it.
struct ServerIdentity {
  Credential credential;
  std::string chainPem;  // an intermediate certificate, or nothing
};

ServerIdentity MakeServerIdentity(const TlsOptions& options, const Credential& authority);

SslContextHandle MakeTlsContext(const TlsOptions& options, const ServerIdentity& identity,
                                const Credential& authority);

}  // namespace DevSts

#endif
