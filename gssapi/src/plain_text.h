#ifndef SSOCLIENT_GSSAPI_PLAIN_TEXT_H
#define SSOCLIENT_GSSAPI_PLAIN_TEXT_H

#include <string>
#include <string_view>

namespace SsoClient {

/// A text of the libraries in the form for a message: in one line of UTF-8, with question marks for
/// control characters and broken bytes, without the blanks and NULs that some end in, and cut after
/// 500 bytes at most. Parts of it may come from a service, a KDC or a credential cache.
std::string PlainText(std::string_view text);

}  // namespace SsoClient

#endif
