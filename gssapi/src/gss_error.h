#ifndef SSOCLIENT_GSSAPI_GSS_ERROR_H
#define SSOCLIENT_GSSAPI_GSS_ERROR_H

#include <gssapi/gssapi.h>

#include <string>

namespace SsoClient {

/// What a GSSAPI call has returned (RFC 2744, section 3.9).
struct GssStatus {
  OM_uint32 major = GSS_S_COMPLETE;
  OM_uint32 minor = 0;
};

/// Throws `SsoException` with `attempt` and the library's own texts for both codes when `status` is
/// an error. To be called on the thread of the failed call, which the library keeps its texts for.
void CheckGssStatus(const std::string& attempt, const GssStatus& status);

}  // namespace SsoClient

#endif
