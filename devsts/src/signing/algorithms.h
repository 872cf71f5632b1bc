#ifndef DEVSTS_SIGNING_ALGORITHMS_H
#define DEVSTS_SIGNING_ALGORITHMS_H

#include <string_view>

#include "devsts/xml_security.h"

namespace DevSts {

// The identifiers defined in XML Signature 1.1, section 6.1, and RFC 6931, section 2.3.10.
const char* UriOf(SignatureAlgorithm algorithm);
const char* UriOf(DigestAlgorithm algorithm);
const char* UriOf(CanonicalMode mode);

// OpenSSL's name of the digest of an RSA-PSS signature; null for every other signature URI.
const char* PssDigestOf(std::string_view signatureUri);

// The canonical form that an identifier names. Throws XmlError for an unknown one.
CanonicalMode CanonicalModeOf(std::string_view uri);

// Whether the form is one of Exclusive XML Canonicalization.
bool IsExclusive(CanonicalMode mode);

}  // namespace DevSts

#endif
