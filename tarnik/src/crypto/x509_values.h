#ifndef TARNIK_CRYPTO_X509_VALUES_H
#define TARNIK_CRYPTO_X509_VALUES_H

#include <optional>
#include <string>

#include <tarnik/system/date_time.h>

#include "support/openssl.h"

// Values that certificates and revocation lists have. The caller has an `ErrorScope`, whose errors
// describe why there is no value.
namespace Tarnik::Crypto {

/// The text of a distinguished name as in RFC 2253.
std::optional<std::string> TextOfName(const X509_NAME* name);
/// The instant of a time, which may be null.
std::optional<System::DateTime> InstantOf(const ASN1_TIME* time);

}  // namespace Tarnik::Crypto

#endif
