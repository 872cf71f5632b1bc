#ifndef SSOCLIENT_GSSAPI_GSS_HANDLE_H
#define SSOCLIENT_GSSAPI_GSS_HANDLE_H

#include <gssapi/gssapi.h>

#include <cstring>

namespace SsoClient {

/// A handle or buffer of the GSSAPI library, released when it dies.
template <class Handle, OM_uint32 (*kRelease)(OM_uint32*, Handle*)>
class GssHandle {
 public:
  GssHandle() = default;
  GssHandle(const GssHandle&) = delete;
  GssHandle& operator=(const GssHandle&) = delete;
  ~GssHandle() { Reset(); }

  const Handle& Get() const noexcept { return handle_; }
  /// For the calls that fill or change the handle.
  Handle* Address() noexcept { return &handle_; }
  void Reset() noexcept {
    OM_uint32 minor = 0;
    kRelease(&minor, &handle_);
    handle_ = Handle();
  }

 private:
  Handle handle_ = Handle();
};

inline OM_uint32 DeleteContext(OM_uint32* minor, gss_ctx_id_t* context) {
  return gss_delete_sec_context(minor, context, GSS_C_NO_BUFFER);
}

// Most hold what logs somebody in.
inline OM_uint32 ReleaseCleansed(OM_uint32* minor, gss_buffer_t buffer) {
  if (buffer->value != nullptr) {
    explicit_bzero(buffer->value, buffer->length);
  }
  return gss_release_buffer(minor, buffer);
}

using GssName = GssHandle<gss_name_t, gss_release_name>;
using GssCredential = GssHandle<gss_cred_id_t, gss_release_cred>;
using GssContext = GssHandle<gss_ctx_id_t, DeleteContext>;
using GssBuffer = GssHandle<gss_buffer_desc, ReleaseCleansed>;

}  // namespace SsoClient

#endif
