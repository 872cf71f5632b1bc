#ifndef TARNIK_TESTS_SUPPORT_ALGORITHM_URIS_H
#define TARNIK_TESTS_SUPPORT_ALGORITHM_URIS_H

namespace Tarnik::Testing {

inline constexpr const char* kEnveloped = "http://www.w3.org/2000/09/xmldsig#enveloped-signature";
inline constexpr const char* kExclusive = "http://www.w3.org/2001/10/xml-exc-c14n#";
inline constexpr const char* kExclusiveWithComments =
    "http://www.w3.org/2001/10/xml-exc-c14n#WithComments";
inline constexpr const char* kInclusive = "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";
inline constexpr const char* kInclusiveWithComments =
    "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#WithComments";
inline constexpr const char* kRsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
inline constexpr const char* kEcdsaSha256 = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
inline constexpr const char* kSha256 = "http://www.w3.org/2001/04/xmlenc#sha256";

}  // namespace Tarnik::Testing

#endif
