#ifndef DEVSTS_SOAP_ASSERTION_WRITER_H
#define DEVSTS_SOAP_ASSERTION_WRITER_H

#include <optional>
#include <string>
#include <vector>

#include "devsts/server.h"
#include "soap/token_request.h"
#include "xml/writer.h"

namespace DevSts {

struct DelegateEntry {
  std::string name;
  Time instant;
};

// Under which conditions a token may be renewed.
struct RenewRestriction {
  unsigned count = 0;  // 0: not any more
  bool postdatable = false;
  bool renewExpired = false;
};

// Everything that an assertion says.
struct TokenContent {
  std::string id;
  std::string issuer;
  std::string subject;
  Time issued;
  Time notBefore;
  Time notOnOrAfter;
  // PEM; makes the token a holder-of-key one.
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

// Namespace declarations that assertions need, for the element that carries them.
XmlWriter::Attributes AssertionNamespaces(const std::string& vendorHost);

// An unsigned assertion (SAML 2.0 Core, section 2.3.3).
std::string WriteAssertion(const TokenContent& content, const AssertionOptions& shape,
                           const std::string& vendorHost, const std::string& solutionHost);

}  // namespace DevSts

#endif
