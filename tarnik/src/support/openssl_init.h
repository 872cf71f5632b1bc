#ifndef TARNIK_SUPPORT_OPENSSL_INIT_H
#define TARNIK_SUPPORT_OPENSSL_INIT_H

namespace Tarnik::OpenSsl {

/// Initialises OpenSSL without its clean-up at process exit, since worker threads may still use it
/// then. Runs when the library is loaded; later calls do nothing.
void Initialise() noexcept;

}  // namespace Tarnik::OpenSsl

#endif
