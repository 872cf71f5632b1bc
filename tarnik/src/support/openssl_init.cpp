#include "support/openssl_init.h"

#include <openssl/crypto.h>

namespace Tarnik::OpenSsl {
namespace {

// A failure is harmless: OpenSSL then initialises itself on first use.
[[maybe_unused]] const bool kInitialisedAtLoad = (Initialise(), true);

}  // namespace

void Initialise() noexcept {
  OPENSSL_init_crypto(OPENSSL_INIT_NO_ATEXIT | OPENSSL_INIT_LOAD_CRYPTO_STRINGS, nullptr);
}

}  // namespace Tarnik::OpenSsl
