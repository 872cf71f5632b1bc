#ifndef SSOCLIENT_GSSAPI_GSS_CREDENTIALS_H
#define SSOCLIENT_GSSAPI_GSS_CREDENTIALS_H

#include <string>

#include "gss_handle.h"

namespace SsoClient {

/// The object identifier of SPNEGO (RFC 4178, section 3).
gss_OID SpnegoMechanism() noexcept;

/// Where credentials come from; what is empty is left to the library.
struct CredentialSource {
  std::string principal;
  std::string keytab;
  std::string cache;
};

/// Credentials to initiate with, by SPNEGO with nothing but Kerberos in it: no other mechanism
/// proves the service's identity. Throws `SsoException`.
void AcquireCredentials(const CredentialSource& source, GssCredential& credentials);

}  // namespace SsoClient

#endif
