#ifndef SSOCLIENT_GSSAPI_KEYTAB_CHECK_H
#define SSOCLIENT_GSSAPI_KEYTAB_CHECK_H

#include <string>

namespace SsoClient {

/// Throws `SsoException`, with the text of the Kerberos library, when the keytab cannot be read or
/// holds no key: of `principal`, unless that is empty.
void CheckKeytab(const std::string& keytab, const std::string& principal);

}  // namespace SsoClient

#endif
