#ifndef SSOCLIENT_GSSAPI_CREDENTIALS_H
#define SSOCLIENT_GSSAPI_CREDENTIALS_H

#include <gssapi/gssapi.h>

#include <string>

#include "handles.h"

namespace SsoClient {

/// Reads `text` as a name of the given type (RFC 2744, section 3.10) into `name`. Throws
/// `SsoException` when the library cannot.
void ImportGssName(const std::string& text, gss_OID type, GssName& name);

/// A credential cache in memory, under a name that nobody else uses. Its tickets are destroyed with
/// it.
class MemoryCache {
 public:
  MemoryCache();
  MemoryCache(const MemoryCache&) = delete;
  MemoryCache& operator=(const MemoryCache&) = delete;
  ~MemoryCache();

  const std::string& Name() const noexcept { return name_; }

 private:
  std::string name_;
};

/// Throws `SsoException`, with the text of the Kerberos library, when the keytab cannot be read or
/// holds no key: of `principal`, unless that is empty.
void CheckKeytab(const std::string& keytab, const std::string& principal);

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
