#include <openssl/err.h>
#include <openssl/ui.h>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>

#include "crypto/passphrase.h"
#include "crypto/private_key_impl.h"
#include "support/openssl_error.h"
#include "support/quote.h"

namespace Tarnik::Crypto {
namespace {

using OwnedUiMethod = OpenSsl::Owned<UI_METHOD, UI_destroy_method>;

// Whatever stands behind the scheme may hold a PIN (RFC 7512, section 2.4): messages name the
// scheme alone.
std::string SchemeOf(const std::string& uri) {
  const std::size_t colon = uri.find(':');
  if (colon == 0 || colon == std::string::npos || uri.find('\0') != std::string::npos) {
    throw CryptoException("The URI of the private key has no scheme or holds a NUL.");
  }
  return uri.substr(0, colon + 1);
}

[[noreturn]] void ThrowUnloadable(const std::string& scheme, const Passphrase& passphrase,
                                  const OpenSsl::ErrorScope& errors) {
  passphrase.RethrowFailure();
  const std::string what = "The private key of a URI " + Quote(scheme) + " cannot be loaded";
  throw CryptoException(
      errors.Describe(passphrase.WasNeeded() ? what + ", or the passphrase is wrong" : what));
}

// A method of the caller's passphrase alone: OpenSSL's own would ask on the terminal.
OwnedUiMethod AskFor(const OpenSsl::ErrorScope& errors) {
  OwnedUiMethod method(UI_UTIL_wrap_read_pem_callback(Passphrase::Read, 0));
  if (method == nullptr) {
    throw CryptoException(errors.Describe("The passphrase cannot be asked for"));
  }
  return method;
}

OpenSsl::OwnedKey OnlyKeyOf(OSSL_STORE_CTX* store, const std::string& scheme,
                            const Passphrase& passphrase, const OpenSsl::ErrorScope& errors) {
  OpenSsl::OwnedKey found;
  while (OSSL_STORE_eof(store) != 1) {
    const OpenSsl::OwnedStoreInfo info(OSSL_STORE_load(store));
    if (info == nullptr && OSSL_STORE_error(store) == 1) {
      ThrowUnloadable(scheme, passphrase, errors);
    }
    if (info == nullptr || OSSL_STORE_INFO_get_type(info.get()) != OSSL_STORE_INFO_PKEY) {
      continue;
    }
    if (found != nullptr) {
      throw CryptoException("The URI " + Quote(scheme) + " names more than one private key.");
    }
    found.reset(OSSL_STORE_INFO_get1_PKEY(info.get()));
  }
  return found;
}

}  // namespace

Ref<const PrivateKey> LoadPrivateKeyFromUri(const std::string& uri,
                                            const PassphraseCallback& passphrase) {
  const std::string scheme = SchemeOf(uri);
  const OpenSsl::ErrorScope errors;
  Passphrase asked(passphrase);
  const OwnedUiMethod method = AskFor(errors);
  const OpenSsl::OwnedStore store(OSSL_STORE_open_ex(uri.c_str(), nullptr, nullptr, method.get(),
                                                     &asked, nullptr, nullptr, nullptr));
  if (store == nullptr || OSSL_STORE_expect(store.get(), OSSL_STORE_INFO_PKEY) != 1) {
    ThrowUnloadable(scheme, asked, errors);
  }
  OpenSsl::OwnedKey key = OnlyKeyOf(store.get(), scheme, asked, errors);
  if (key == nullptr) {
    asked.RethrowFailure();
    throw CryptoException("The URI " + Quote(scheme) + " names no private key.");
  }
  return MakeRef<const PrivateKeyImpl>(std::move(key));
}

}  // namespace Tarnik::Crypto
