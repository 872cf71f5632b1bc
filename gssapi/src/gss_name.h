#ifndef SSOCLIENT_GSSAPI_GSS_NAME_H
#define SSOCLIENT_GSSAPI_GSS_NAME_H

#include <string>

#include "gss_handle.h"

namespace SsoClient {

/// Reads `text` as a name of the given type (RFC 2744, section 3.10) into `name`. Throws
/// `SsoException` when the library cannot.
void ImportGssName(const std::string& text, gss_OID type, GssName& name);

}  // namespace SsoClient

#endif
