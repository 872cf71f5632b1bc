#ifndef TARNIK_SSL_TLS_ERROR_TEXT_H
#define TARNIK_SSL_TLS_ERROR_TEXT_H

#include <string>

namespace Tarnik::Ssl {

/// What the OpenSSL error says. For an alert of the peer, this is "the peer sent the alert NAME"
/// with its name in RFC 8446, section 6, and then OpenSSL's reason in brackets, whose words depend
/// on its version. For any other error, it is OpenSSL's reason, or "unknown cause".
std::string TlsErrorText(unsigned long error);

}  // namespace Tarnik::Ssl

#endif
