#include "signing/algorithms.h"

#include <string>

namespace DevSts {
namespace {

constexpr char kPssSha256[] = "http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1";
constexpr char kPssSha384[] = "http://www.w3.org/2007/05/xmldsig-more#sha384-rsa-MGF1";
constexpr char kPssSha512[] = "http://www.w3.org/2007/05/xmldsig-more#sha512-rsa-MGF1";

}  // namespace

const char* UriOf(SignatureAlgorithm algorithm) {
  switch (algorithm) {
    case SignatureAlgorithm::RsaSha256:
      return "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";
    case SignatureAlgorithm::RsaSha384:
      return "http://www.w3.org/2001/04/xmldsig-more#rsa-sha384";
    case SignatureAlgorithm::RsaSha512:
      return "http://www.w3.org/2001/04/xmldsig-more#rsa-sha512";
    case SignatureAlgorithm::RsaPssSha256:
      return kPssSha256;
    case SignatureAlgorithm::RsaPssSha384:
      return kPssSha384;
    case SignatureAlgorithm::RsaPssSha512:
      return kPssSha512;
    case SignatureAlgorithm::EcdsaSha256:
      return "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
    case SignatureAlgorithm::EcdsaSha384:
      return "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha384";
    case SignatureAlgorithm::EcdsaSha512:
      return "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512";
    case SignatureAlgorithm::RsaSha1:
      return "http://www.w3.org/2000/09/xmldsig#rsa-sha1";
  }
  throw XmlError("unknown signature algorithm");
}

const char* UriOf(DigestAlgorithm algorithm) {
  switch (algorithm) {
    case DigestAlgorithm::Sha256:
      return "http://www.w3.org/2001/04/xmlenc#sha256";
    case DigestAlgorithm::Sha384:
      return "http://www.w3.org/2001/04/xmldsig-more#sha384";
    case DigestAlgorithm::Sha512:
      return "http://www.w3.org/2001/04/xmlenc#sha512";
    case DigestAlgorithm::Sha1:
      return "http://www.w3.org/2000/09/xmldsig#sha1";
  }
  throw XmlError("unknown digest algorithm");
}

const char* UriOf(CanonicalMode mode) {
  switch (mode) {
    case CanonicalMode::Inclusive:
      return "http://www.w3.org/TR/2001/REC-xml-c14n-20010315";
    case CanonicalMode::InclusiveWithComments:
      return "http://www.w3.org/TR/2001/REC-xml-c14n-20010315#WithComments";
    case CanonicalMode::Exclusive:
      return "http://www.w3.org/2001/10/xml-exc-c14n#";
    case CanonicalMode::ExclusiveWithComments:
      return "http://www.w3.org/2001/10/xml-exc-c14n#WithComments";
  }
  throw XmlError("unknown canonical form");
}

const char* PssDigestOf(std::string_view signatureUri) {
  if (signatureUri == kPssSha256) {
    return "SHA256";
  }
  if (signatureUri == kPssSha384) {
    return "SHA384";
  }
  return signatureUri == kPssSha512 ? "SHA512" : nullptr;
}

CanonicalMode CanonicalModeOf(std::string_view uri) {
  for (const CanonicalMode mode :
       {CanonicalMode::Inclusive, CanonicalMode::InclusiveWithComments, CanonicalMode::Exclusive,
        CanonicalMode::ExclusiveWithComments}) {
    if (uri == UriOf(mode)) {
      return mode;
    }
  }
  throw XmlError("unknown canonical form: " + std::string(uri));
}

bool IsExclusive(CanonicalMode mode) {
  return mode == CanonicalMode::Exclusive || mode == CanonicalMode::ExclusiveWithComments;
}

}  // namespace DevSts
