#ifndef SSOCLIENT_GSSAPI_ERRORS_H
#define SSOCLIENT_GSSAPI_ERRORS_H

#include <gssapi/gssapi.h>

#include <string>
#include <string_view>

namespace SsoClient {

/// A text of the libraries in the form for a message: in one line of UTF-8, with question marks for
/// control characters and broken bytes, without the blanks and NULs that some end in, and cut after
/// 500 bytes at most. Parts of it may come from a service, a KDC or a credential cache.
std::string PlainText(std::string_view text);

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
