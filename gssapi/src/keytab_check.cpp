#include "keytab_check.h"

#include <ssoclient/exceptions.h>

#include "krb5_handles.h"
#include "plain_text.h"

namespace SsoClient {

namespace {

// The calls that look into one keytab.
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

void CheckKeytab(const std::string& keytab, const std::string& principal) {
  const KeytabReader reader(keytab);
  if (principal.empty()) {
    reader.RequireAKey();
    return;
  }
  reader.RequireAKeyOf(principal);
}

}  // namespace SsoClient
