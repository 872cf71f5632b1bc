#include "credentials.h"

#include <vector>

#include <gssapi/gssapi_ext.h>
#include <gssapi/gssapi_krb5.h>
#include <krb5.h>

#include <ssoclient/exceptions.h>
#include <tarnik/text/string_util.h>

#include "errors.h"

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

// The calls that read one keytab.
class KeytabReader {
 public:
  explicit KeytabReader(const std::string& name) : name_(name), context_(CreateKrb5Context()) {
    if (context_ == nullptr) {
      throw SsoException(Failure() + ": the Kerberos configuration cannot be read.");
    }
    krb5_keytab keytab = nullptr;
    Check(krb5_kt_resolve(context_.get(), name.c_str(), &keytab));
    keytab_ = {keytab, {context_.get()}};
  }

  void RequireAKey() const { Check(krb5_kt_have_content(context_.get(), keytab_.get())); }

  void RequireAKeyOf(const std::string& principalName) const {
    krb5_principal parsed = nullptr;
    Check(krb5_parse_name(context_.get(), principalName.c_str(), &parsed));
    const Krb5Principal principal(parsed, {context_.get()});
    krb5_keytab_entry entry{};
    Check(krb5_kt_get_entry(context_.get(), keytab_.get(), principal.get(), 0, 0, &entry));
    krb5_free_keytab_entry_contents(context_.get(), &entry);
  }

 private:
  std::string Failure() const { return "The keytab `" + name_ + "' cannot be used"; }

  void Check(krb5_error_code code) const {
    if (code == 0) {
      return;
    }
    const char* text = krb5_get_error_message(context_.get(), code);
    const std::string message = Failure() + ": " + PlainText(text) + ".";
    krb5_free_error_message(context_.get(), text);
    throw SsoException(message);
  }

  const std::string& name_;
  Krb5Context context_;
  Krb5Keytab keytab_{nullptr, {nullptr}};
};

}  // namespace

void ImportGssName(const std::string& text, gss_OID type, GssName& name) {
  gss_buffer_desc buffer{text.size(), const_cast<char*>(text.data())};
  GssStatus status;
  status.major = gss_import_name(&status.minor, &buffer, type, name.Address());
  CheckGssStatus("The name `" + text + "' cannot be read", status);
}

MemoryCache::MemoryCache() : name_("MEMORY:" + Tarnik::StringUtil::GenerateUuid()) {}

// GSSAPI creates the cache when it first stores tickets, but has no call that destroys it.
MemoryCache::~MemoryCache() {
  const auto context = CreateKrb5Context();
  krb5_ccache cache = nullptr;
  if (context != nullptr && krb5_cc_resolve(context.get(), name_.c_str(), &cache) == 0) {
    krb5_cc_destroy(context.get(), cache);
  }
}

void CheckKeytab(const std::string& keytab, const std::string& principal) {
  const KeytabReader reader(keytab);
  if (principal.empty()) {
    reader.RequireAKey();
    return;
  }
  reader.RequireAKeyOf(principal);
}

gss_OID SpnegoMechanism() noexcept {
  static char bytes[] = "\x2b\x06\x01\x05\x05\x02";
  static gss_OID_desc mechanism{sizeof(bytes) - 1, bytes};
  return &mechanism;
}

void AcquireCredentials(const CredentialSource& source, GssCredential& credentials) {
  // GSSAPI does not report what is wrong with a keytab.
  if (!source.keytab.empty()) {
    CheckKeytab(source.keytab, source.principal);
  }
  GssName principal;
  if (!source.principal.empty()) {
    ImportGssName(source.principal, GSS_C_NT_USER_NAME, principal);
  }
  // SPNEGO does not report why Kerberos has no credentials.
  GssCredential sample;
  Acquire(source, principal, gss_mech_krb5, sample);
  Acquire(source, principal, SpnegoMechanism(), credentials);

  gss_OID_set_desc kerberos{1, gss_mech_krb5};
  GssStatus status;
  status.major = gss_set_neg_mechs(&status.minor, credentials.Get(), &kerberos);
  CheckGssStatus(kAttempt, status);
}

}  // namespace SsoClient
