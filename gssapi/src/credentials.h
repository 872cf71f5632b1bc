#ifndef SSOCLIENT_GSSAPI_CREDENTIALS_H
#define SSOCLIENT_GSSAPI_CREDENTIALS_H

#include <string>

#include <gssapi/gssapi.h>

#include "handles.h"

namespace SsoClient {

/// Parses `text` as a name of the given type (RFC 2744, section 3.10) into `name`. Throws
/// `SsoException` if the library cannot parse it.
void ImportGssName(const std::string& text, gss_OID type, GssName& name);

/// A credential cache in memory with a unique name. The destructor destroys its tickets.
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

/// Throws `SsoException`, with the text of the Kerberos library, if the keytab cannot be read or
/// has no key of `principal`, or no key at all if `principal` is empty.
void CheckKeytab(const std::string& keytab, const std::string& principal);

/// The object identifier of SPNEGO (RFC 4178, section 3).
gss_OID SpnegoMechanism() noexcept;

/// Where credentials come from. The library chooses a default for each empty field.
struct CredentialSource {
  std::string principal;
  std::string keytab;
  std::string cache;
};

/// Acquires credentials to initiate a negotiation with SPNEGO. They are restricted to Kerberos,
/// because no other mechanism proves the service's identity. Throws `SsoException`.
void AcquireCredentials(const CredentialSource& source, GssCredential& credentials);

}  // namespace SsoClient

#endif
