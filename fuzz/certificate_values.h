#ifndef FUZZ_CERTIFICATE_VALUES_H
#define FUZZ_CERTIFICATE_VALUES_H

#include <string>
#include <string_view>

#include <openssl/x509.h>

namespace Fuzz {

const unsigned char* BytesOf(std::string_view text);
/// As OpenSSL prints the name, in the form of RFC 2253 with characters outside ASCII as they are.
std::string TextOf(const X509_NAME* name);
/// Since 1970; fails for what is no time.
long SecondsOf(const ASN1_TIME* time);

}  // namespace Fuzz

#endif
