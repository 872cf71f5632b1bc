#ifndef TARNIK_SUPPORT_OPENSSL_INIT_H
#define TARNIK_SUPPORT_OPENSSL_INIT_H

namespace Tarnik::OpenSsl {

/// Initialises OpenSSL without its clean-up at process exit: worker threads may still be inside it
/// when the process ends. Runs when the library is loaded; later calls do nothing.
void Initialise() noexcept;

}  // namespace Tarnik::OpenSsl

#endif
