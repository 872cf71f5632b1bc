#ifndef DEVSTS_SOAP_ASSERTION_WRITER_H
#define DEVSTS_SOAP_ASSERTION_WRITER_H

#include <optional>
#include <string>
#include <vector>

#include "devsts/server.h"
#include "soap/token_request.h"
#include "xml/writer.h"

namespace DevSts {

// The Method of the SubjectConfirmation of a holder-of-key token (SAML 2.0 Profiles, section 3.1).
inline constexpr char kHolderOfKeyMethod[] = "urn:oasis:names:tc:SAML:2.0:cm:holder-of-key";

struct DelegateEntry {
  std::string name;
  Time instant;
};

// The conditions under which a token may be renewed.
struct RenewRestriction {
  unsigned count = 0;  // 0: no more renewals
  bool postdatable = false;
  bool renewExpired = false;
};

// The content of an assertion.
struct TokenContent {
  std::string id;
  std::string issuer;
  std::string subject;
  Time issued;
  Time notBefore;
  Time notOnOrAfter;
  // PEM; if present, the token is a holder-of-key token.
  std::optional<std::string> holderCertificatePem;
  std::optional<RenewRestriction> renewal;
  std::optional<unsigned> proxyCount;
  std::vector<DelegateEntry> delegates;
  std::vector<std::string> audiences;
  std::vector<AdviceRequest> advice;
  User user;
  Time authenticated;
  std::string authenticationClass;
};

// The namespace declarations that an assertion needs.
XmlWriter::Attributes AssertionNamespaces(const std::string& vendorHost);

// Writes an unsigned assertion (SAML 2.0 Core, section 2.3.3).
std::string WriteAssertion(const TokenContent& content, const AssertionOptions& shape,
                           const std::string& vendorHost, const std::string& solutionHost);

}  // namespace DevSts

#endif
