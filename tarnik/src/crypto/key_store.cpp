#include <cerrno>
#include <cstdio>
#include <string_view>
#include <system_error>

#include <openssl/err.h>
#include <openssl/ui.h>
#include <sys/stat.h>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>

#include "crypto/passphrase.h"
#include "crypto/private_key_impl.h"
#include "support/ascii.h"
#include "support/openssl_error.h"
#include "support/quote.h"
#include "system/file.h"

namespace Tarnik::Crypto {
namespace {

constexpr int kMaxFailures = 1000;

using OwnedUiMethod = OpenSsl::Owned<UI_METHOD, UI_destroy_method>;

// The rest of the URI may contain a PIN (RFC 7512, section 2.4), so messages name only the scheme.
std::string SchemeOf(const std::string& uri) {
  const std::size_t colon = uri.find(':');
  if (colon == 0 || colon == std::string::npos || uri.find('\0') != std::string::npos) {
    throw CryptoException("The URI of the private key has no scheme or holds a NUL.");
  }
  return uri.substr(0, colon + 1);
}

[[noreturn]] void ThrowNoKey(const std::string& scheme, const Passphrase& passphrase,
                             const OpenSsl::ErrorScope& errors) {
  passphrase.RethrowFailure();
  const std::string what = "The URI " + Quote(scheme) + " gives no private key";
  throw CryptoException(
      errors.Describe(passphrase.WasNeeded() ? what + ", or the passphrase is wrong" : what));
}

// Used instead of OpenSSL's adapter for PEM callbacks, which leaves the text on the stack.
int AnswerPrompt(UI* dialog, UI_STRING* question) noexcept {
  const UI_string_types type = UI_get_string_type(question);
  if (type != UIT_PROMPT && type != UIT_VERIFY) {
    return 1;
  }
  try {
    const std::string& text = static_cast<Passphrase*>(UI_get0_user_data(dialog))->Get();
    const int set = UI_set_result_ex(dialog, question, text.data(), static_cast<int>(text.size()));
    return set == 0 ? 1 : 0;
  } catch (...) {
    return 0;
  }
}

// Answers prompts only with the caller's passphrase: OpenSSL's default method asks on the terminal.
OwnedUiMethod CreateUiMethod(const OpenSsl::ErrorScope& errors) {
  OwnedUiMethod method(UI_create_method("caller"));
  if (method == nullptr || UI_method_set_reader(method.get(), AnswerPrompt) != 0) {
    throw CryptoException(errors.Describe("Cannot ask for the passphrase"));
  }
  return method;
}

// A store reports an error for each object that it skips, also after the key, so it is read to its
// end. The number of failures is limited, since a store that only fails never reports an end.
OpenSsl::OwnedKey OnlyKeyOf(OSSL_STORE_CTX* store, const std::string& scheme) {
  OpenSsl::OwnedKey found;
  for (int failures = 0; failures < kMaxFailures && OSSL_STORE_eof(store) != 1;) {
    const OpenSsl::OwnedStoreInfo info(OSSL_STORE_load(store));
    if (info == nullptr) {
      ++failures;
      continue;
    }
    if (OSSL_STORE_INFO_get_type(info.get()) != OSSL_STORE_INFO_PKEY) {
      continue;
    }
    if (found != nullptr) {
      throw CryptoException("The URI " + Quote(scheme) + " gives more than one private key.");
    }
    found.reset(OSSL_STORE_INFO_get1_PKEY(info.get()));
  }
  return found;
}

// The path of a URI of a local file (RFC 8089, section 2) whose scheme is `scheme`, as OpenSSL
// reads it. Empty if the URI names a file of another host.
std::string PathOf(const std::string& uri, const std::string& scheme) {
  constexpr std::string_view kLocalHost = "//localhost/";
  const std::string_view rest = std::string_view(uri).substr(scheme.size());
  if (EqualsIgnoringCase(rest.substr(0, kLocalHost.size()), kLocalHost)) {
    return std::string(rest.substr(kLocalHost.size() - 1));
  }
  if (rest.substr(0, 3) == "///") {
    return std::string(rest.substr(2));
  }
  return rest.substr(0, 2) == "//" ? "" : std::string(rest);
}

bool IsFolder(std::FILE* file) {
  struct stat status {};
  return fstat(fileno(file), &status) == 0 && S_ISDIR(status.st_mode);
}

[[noreturn]] void ThrowNoFile(const std::string& scheme, const std::string& reason) {
  throw CryptoException("The URI " + Quote(scheme) + " gives no private key: " + reason + ".");
}

// OpenSSL opens files in descriptors that child processes inherit, so files are opened here. The
// store reads the source, which must outlive it.
OpenSsl::OwnedBio OpenFile(const std::string& uri, const std::string& scheme,
                           const OpenSsl::ErrorScope& errors) {
  const std::string path = PathOf(uri, scheme);
  if (path.empty()) {
    ThrowNoFile(scheme, "it names no file of this machine");
  }
  System::OwnedFile file = System::OpenForReading(path);
  if (file == nullptr) {
    ThrowNoFile(scheme, std::generic_category().message(errno));
  }
  if (IsFolder(file.get())) {
    ThrowNoFile(scheme, "it names a folder");
  }
  OpenSsl::OwnedBio source(BIO_new_fp(file.get(), BIO_CLOSE));
  if (source == nullptr) {
    throw CryptoException(errors.Describe("The private key file cannot be read"));
  }
  static_cast<void>(file.release());
  return source;
}

// Whatever the scheme, OpenSSL first looks for a file whose path is the whole URI. Such a file in
// the working folder must not take the place of a device.
void RequireNoFile(const std::string& uri, const std::string& scheme) {
  struct stat status {};
  if (stat(uri.c_str(), &status) == 0) {
    ThrowNoFile(scheme, "a file has the URI as its name");
  }
}

OpenSsl::OwnedStore OpenStore(const std::string& uri, BIO* source, const UI_METHOD* method,
                              Passphrase& passphrase) {
  if (source != nullptr) {
    return OpenSsl::OwnedStore(OSSL_STORE_attach(source, "file", nullptr, nullptr, method,
                                                 &passphrase, nullptr, nullptr, nullptr));
  }
  return OpenSsl::OwnedStore(OSSL_STORE_open_ex(uri.c_str(), nullptr, nullptr, method, &passphrase,
                                                nullptr, nullptr, nullptr));
}

// Null if the URI names no file but, for example, a device.
OpenSsl::OwnedBio OpenSource(const std::string& uri, const std::string& scheme,
                             const OpenSsl::ErrorScope& errors) {
  if (EqualsIgnoringCase(scheme, "file:")) {
    return OpenFile(uri, scheme, errors);
  }
  RequireNoFile(uri, scheme);
  return nullptr;
}

}  // namespace

Ref<const PrivateKey> LoadPrivateKeyFromUri(const std::string& uri,
                                            const PassphraseCallback& passphrase) {
  const std::string scheme = SchemeOf(uri);
  const OpenSsl::ErrorScope errors;
  Passphrase asked(passphrase);
  const OwnedUiMethod method = CreateUiMethod(errors);
  const OpenSsl::OwnedBio source = OpenSource(uri, scheme, errors);
  const OpenSsl::OwnedStore store = OpenStore(uri, source.get(), method.get(), asked);
  OpenSsl::OwnedKey key;
  if (store != nullptr && OSSL_STORE_expect(store.get(), OSSL_STORE_INFO_PKEY) == 1) {
    key = OnlyKeyOf(store.get(), scheme);
  }
  if (key == nullptr) {
    ThrowNoKey(scheme, asked, errors);
  }
  return MakeRef<const PrivateKeyImpl>(std::move(key));
}

}  // namespace Tarnik::Crypto
