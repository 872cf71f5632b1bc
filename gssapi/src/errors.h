#ifndef SSOCLIENT_GSSAPI_ERRORS_H
#define SSOCLIENT_GSSAPI_ERRORS_H

#include <string>
#include <string_view>

#include <gssapi/gssapi.h>

namespace SsoClient {

/// Text of the libraries in a form that is safe in a message: one line of UTF-8, with question
/// marks in place of control characters and invalid bytes, without the trailing blanks and NULs
/// that some texts have, and truncated after at most 500 bytes. Parts of such a text may come from
/// a service, a KDC or a credential cache.
std::string PlainText(std::string_view text);

/// The status codes of a GSSAPI call (RFC 2744, section 3.9).
struct GssStatus {
  OM_uint32 major = GSS_S_COMPLETE;
  OM_uint32 minor = 0;
};

/// Throws `SsoException` with `attempt` and the library's texts for both codes if `status` is an
/// error. Must be called on the thread of the failed call, for which the library keeps its texts.
void CheckGssStatus(const std::string& attempt, const GssStatus& status);

}  // namespace SsoClient

#endif
