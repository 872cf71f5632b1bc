#ifndef SSOCLIENT_GSSAPI_RELEASED_BUFFERS_H
#define SSOCLIENT_GSSAPI_RELEASED_BUFFERS_H

#include <string>

namespace SsoClient::Testing {

/// What the buffer held that this thread gave to GSSAPI last to be released.
const std::string& LastReleasedBuffer();

}  // namespace SsoClient::Testing

#endif
