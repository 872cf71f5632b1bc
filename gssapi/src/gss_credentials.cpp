#include "gss_credentials.h"

#include <gssapi/gssapi_ext.h>
#include <gssapi/gssapi_krb5.h>

#include <vector>

#include "gss_error.h"
#include "gss_name.h"
#include "keytab_check.h"

namespace SsoClient {

namespace {

constexpr char kAttempt[] = "There are no credentials to log in with";

std::vector<gss_key_value_element_desc> StoreOf(const CredentialSource& source) {
  std::vector<gss_key_value_element_desc> store;
  if (!source.keytab.empty()) {
    store.push_back({"client_keytab", source.keytab.c_str()});
  }
  if (!source.cache.empty()) {
    store.push_back({"ccache", source.cache.c_str()});
  }
  return store;
}

void Acquire(const CredentialSource& source, const GssName& principal, gss_OID mechanism,
             GssCredential& credentials) {
  auto elements = StoreOf(source);
  const gss_key_value_set_desc store{static_cast<OM_uint32>(elements.size()), elements.data()};
  gss_OID_set_desc mechanisms{1, mechanism};
  GssStatus status;
  status.major = gss_acquire_cred_from(
      &status.minor, principal.Get(), GSS_C_INDEFINITE, &mechanisms, GSS_C_INITIATE,
      elements.empty() ? GSS_C_NO_CRED_STORE : &store, credentials.Address(), nullptr, nullptr);
  CheckGssStatus(kAttempt, status);
}

}  // namespace

gss_OID SpnegoMechanism() noexcept {
  static char bytes[] = "\x2b\x06\x01\x05\x05\x02";
  static gss_OID_desc mechanism{sizeof(bytes) - 1, bytes};
  return &mechanism;
}

void AcquireCredentials(const CredentialSource& source, GssCredential& credentials) {
  // GSSAPI does not tell what is wrong with a keytab.
  if (!source.keytab.empty()) {
    CheckKeytab(source.keytab, source.principal);
  }
  GssName principal;
  if (!source.principal.empty()) {
    ImportGssName(source.principal, GSS_C_NT_USER_NAME, principal);
  }
  // SPNEGO does not tell why Kerberos has none.
  GssCredential sample;
  Acquire(source, principal, gss_mech_krb5, sample);
  Acquire(source, principal, SpnegoMechanism(), credentials);

  gss_OID_set_desc kerberos{1, gss_mech_krb5};
  GssStatus status;
  status.major = gss_set_neg_mechs(&status.minor, credentials.Get(), &kerberos);
  CheckGssStatus(kAttempt, status);
}

}  // namespace SsoClient
