#ifndef DEVSTS_SOAP_PRESENTED_TOKEN_H
#define DEVSTS_SOAP_PRESENTED_TOKEN_H

#include <optional>
#include <string>
#include <vector>

#include <libxml/tree.h>

#include "soap/assertion_writer.h"

namespace DevSts {

// The content of an assertion that a client presents.
struct PresentedToken {
  std::string id;
  std::string subject;
  std::vector<DelegateEntry> delegates;
  Time notBefore;
  Time notOnOrAfter;
  std::optional<std::string> holderCertificatePem;  // of a holder-of-key token
  unsigned proxyCount = 0;                          // 0: not delegable
  std::optional<RenewRestriction> renewal;

  // The principal that may use the token: the last delegate, else the subject.
  const std::string& Bearer() const { return delegates.empty() ? subject : delegates.back().name; }
};

// Reads an assertion; `place` names it in faults ("The ActAs token"). Does not check whether the
// token is valid. Throws Fault.
PresentedToken ReadPresentedToken(xmlNode* assertion, const std::string& place);

// The certificate, as PEM, in SubjectConfirmationData (SAML 2.0 Profiles, section 3.1). Throws
// Fault if the assertion is not a holder-of-key token.
std::string HolderCertificateOf(xmlNode* assertion, const std::string& place);

}  // namespace DevSts

#endif
