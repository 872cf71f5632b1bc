#include "released_buffers.h"

#include <gssapi/gssapi.h>

namespace {

thread_local std::string lastReleased;

}  // namespace

// The linker puts the second for the first, and leaves the library's own as the first.
extern "C" {

OM_uint32 __real_gss_release_buffer(OM_uint32*, gss_buffer_t);

OM_uint32 __wrap_gss_release_buffer(OM_uint32* minor, gss_buffer_t buffer) {
  lastReleased.assign(static_cast<const char*>(buffer->value), buffer->length);
  return __real_gss_release_buffer(minor, buffer);
}
}

namespace SsoClient::Testing {

const std::string& LastReleasedBuffer() {
  return lastReleased;
}

}  // namespace SsoClient::Testing
