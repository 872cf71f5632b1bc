#ifndef SSOCLIENT_GSSAPI_KRB5_HANDLES_H
#define SSOCLIENT_GSSAPI_KRB5_HANDLES_H

#include <krb5.h>

#include <memory>
#include <type_traits>

namespace SsoClient {

struct Krb5ContextDeleter {
  void operator()(krb5_context context) const noexcept { krb5_free_context(context); }
};
using Krb5Context = std::unique_ptr<std::remove_pointer_t<krb5_context>, Krb5ContextDeleter>;

/// Frees what belongs to a context, which has to live longer.
template <class Object, auto kFree>
struct Krb5Deleter {
  krb5_context context;
  void operator()(Object object) const noexcept { kFree(context, object); }
};
using Krb5Keytab =
    std::unique_ptr<std::remove_pointer_t<krb5_keytab>, Krb5Deleter<krb5_keytab, krb5_kt_close>>;
using Krb5Principal = std::unique_ptr<std::remove_pointer_t<krb5_principal>,
                                      Krb5Deleter<krb5_principal, krb5_free_principal>>;

/// Null when the Kerberos library cannot read its configuration.
inline Krb5Context CreateKrb5Context() noexcept {
  krb5_context context = nullptr;
  return Krb5Context(krb5_init_context(&context) == 0 ? context : nullptr);
}

}  // namespace SsoClient

#endif
