#ifndef SSOCLIENT_TESTS_SUPPORT_RESIGNED_H
#define SSOCLIENT_TESTS_SUPPORT_RESIGNED_H

#include <string>
#include <vector>

#include <devsts/certificates.h>

namespace SsoClient::Testing {

/// A signed document with a new ECDSA-SHA256 value over its first ds:SignedInfo in exclusive form,
/// by a P-256 key, so that only a digest or a rule can be wrong.
std::string Resigned(const std::string& xml, const DevSts::Credential& credential);

/// The two numbers of the signature value of `xml`, and `xml` with other octets as its value.
std::vector<unsigned char> SignatureValueOf(const std::string& xml);
std::string WithSignatureValue(const std::string& xml, const std::vector<unsigned char>& octets);
/// The same numbers in DER.
std::vector<unsigned char> InDer(const std::vector<unsigned char>& numbers);

}  // namespace SsoClient::Testing

#endif
