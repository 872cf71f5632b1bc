#ifndef SSOCLIENT_GSSAPI_HANDLES_H
#define SSOCLIENT_GSSAPI_HANDLES_H

#include <cstring>
#include <memory>
#include <type_traits>

#include <gssapi/gssapi.h>
#include <krb5.h>

namespace SsoClient {

/// A handle or buffer of the GSSAPI library, released by the destructor.
template <class Handle, OM_uint32 (*kRelease)(OM_uint32*, Handle*)>
class GssHandle {
 public:
  GssHandle() = default;
  GssHandle(const GssHandle&) = delete;
  GssHandle& operator=(const GssHandle&) = delete;
  ~GssHandle() { Reset(); }

  const Handle& Get() const noexcept { return handle_; }
  /// For calls that set or change the handle.
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

// Most buffers contain data that authenticates a client.
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

struct Krb5ContextDeleter {
  void operator()(krb5_context context) const noexcept { krb5_free_context(context); }
};
using Krb5Context = std::unique_ptr<std::remove_pointer_t<krb5_context>, Krb5ContextDeleter>;

/// Frees an object that belongs to a context, which must outlive it.
template <class Object, auto kFree>
struct Krb5Deleter {
  krb5_context context;
  void operator()(Object object) const noexcept { kFree(context, object); }
};
using Krb5Keytab =
    std::unique_ptr<std::remove_pointer_t<krb5_keytab>, Krb5Deleter<krb5_keytab, krb5_kt_close>>;
using Krb5Principal = std::unique_ptr<std::remove_pointer_t<krb5_principal>,
                                      Krb5Deleter<krb5_principal, krb5_free_principal>>;

/// Returns null if the Kerberos library cannot read its configuration.
inline Krb5Context CreateKrb5Context() noexcept {
  krb5_context context = nullptr;
  return Krb5Context(krb5_init_context(&context) == 0 ? context : nullptr);
}

}  // namespace SsoClient

#endif
