#ifndef FUZZ_XMLSEC_H
#define FUZZ_XMLSEC_H

#include <string>
#include <vector>

#include <openssl/evp.h>

namespace Fuzz {

/// One ds:Reference as xmlsec1 has processed it.
struct ReadReference {
  std::string uri;
  /// The octets that were digested.
  std::string octets;
};

/// What xmlsec1 and libxml2 find in a signed document.
struct ReadSignature {
  bool isValid = false;
  std::string signatureMethod;
  std::string canonicalizationMethod;
  std::vector<std::string> digestMethods;
  std::vector<std::string> transforms;
  std::vector<ReadReference> references;
};

/// Verifies the first ds:Signature of `xml` with `key`, or the one with this Id; KeyInfo is
/// ignored. Ids are the attributes ID, Id and id without a prefix, xml:id and wsu:Id. OpenSSL
/// verifies the signature value of RSA-PSS, which xmlsec1 does not know.
ReadSignature VerifyWithXmlSec(const std::string& xml, EVP_PKEY* key,
                               const std::string& signatureId = "");

/// `xml` with the digests and the value of its first ds:Signature, which has empty elements for
/// them; empty if xmlsec1 cannot process a reference, or the key does not fit the method.
std::string SignWithXmlSec(const std::string& xml, EVP_PKEY* key);

}  // namespace Fuzz

#endif
