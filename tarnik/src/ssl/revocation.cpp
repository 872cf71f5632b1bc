#include "ssl/revocation.h"

#include "support/openssl_error.h"

namespace Tarnik::Ssl {
namespace {

struct FreeLists {
  void operator()(STACK_OF(X509_CRL) * lists) const noexcept {
    sk_X509_CRL_pop_free(lists, X509_CRL_free);
  }
};
using OwnedLists = std::unique_ptr<STACK_OF(X509_CRL), FreeLists>;
using OwnedStoreContext = OpenSsl::Owned<X509_STORE_CTX, X509_STORE_CTX_free>;

// OpenSSL's own check of a certificate against one list. It has no name, but each verification
// without another check is set up with it.
X509_STORE_CTX_cert_crl_fn FindDefaultCheck() {
  const OpenSsl::ErrorScope errors;
  const OpenSsl::OwnedTrustStore store(X509_STORE_new());
  const OwnedStoreContext context(X509_STORE_CTX_new());
  if (store == nullptr || context == nullptr ||
      X509_STORE_CTX_init(context.get(), store.get(), nullptr, nullptr) != 1) {
    return nullptr;
  }
  return X509_STORE_CTX_get_cert_crl(context.get());
}

X509_STORE_CTX_cert_crl_fn DefaultCheck() {
  static const X509_STORE_CTX_cert_crl_fn check = FindDefaultCheck();
  return check;
}

// The next certificate of the chain, or the last one itself.
const X509* IssuerOf(X509_STORE_CTX* context) {
  const STACK_OF(X509)* chain = X509_STORE_CTX_get0_chain(context);
  const int next = X509_STORE_CTX_get_error_depth(context) + 1;
  const int count = sk_X509_num(chain);
  return count == 0 ? nullptr : sk_X509_value(chain, next < count ? next : count - 1);
}

bool HaveSameDate(const X509_CRL* a, const X509_CRL* b) {
  return ASN1_TIME_compare(X509_CRL_get0_lastUpdate(a), X509_CRL_get0_lastUpdate(b)) == 0;
}

// Lists of another issuer of that name do not count.
bool IsSignedBy(X509_CRL* list, const X509* issuer) {
  EVP_PKEY* key = issuer == nullptr ? nullptr : X509_get0_pubkey(issuer);
  return key != nullptr && X509_CRL_verify(list, key) == 1;
}

bool IsRevokedBy(X509_CRL* list, X509* certificate) {
  constexpr int kRevoked = 1;  // 2 means an entry that lifts an earlier revocation
  X509_REVOKED* entry = nullptr;
  return X509_CRL_get0_by_cert(list, &entry, certificate) == kRevoked;
}

bool IsRevokedByAnother(X509_STORE_CTX* context, const X509_CRL* chosen, X509* certificate) {
  const OpenSsl::ErrorScope errors;
  const OwnedLists lists(X509_STORE_CTX_get1_crls(context, X509_get_issuer_name(certificate)));
  const X509* issuer = IssuerOf(context);
  for (int i = 0; i < sk_X509_CRL_num(lists.get()); ++i) {
    X509_CRL* list = sk_X509_CRL_value(lists.get(), i);
    if (list != chosen && HaveSameDate(list, chosen) && IsRevokedBy(list, certificate) &&
        IsSignedBy(list, issuer)) {
      return true;
    }
  }
  return false;
}

// Called with the list that OpenSSL has chosen for `certificate`.
int CheckCertificate(X509_STORE_CTX* context, X509_CRL* chosen, X509* certificate) {
  const X509_STORE_CTX_cert_crl_fn check = DefaultCheck();
  if (check == nullptr) {
    X509_STORE_CTX_set_error(context, X509_V_ERR_OUT_OF_MEM);
    return 0;
  }
  const int result = check(context, chosen, certificate);
  if (result != 1 || !IsRevokedByAnother(context, chosen, certificate)) {
    return result;
  }
  X509_STORE_CTX_set_error(context, X509_V_ERR_CERT_REVOKED);
  return X509_STORE_CTX_get_verify_cb(context)(0, context);
}

}  // namespace

void CheckRevocation(X509_STORE* store) {
  X509_STORE_set_flags(store, X509_V_FLAG_CRL_CHECK | X509_V_FLAG_CRL_CHECK_ALL);
  X509_STORE_set_cert_crl(store, CheckCertificate);
}

}  // namespace Tarnik::Ssl
