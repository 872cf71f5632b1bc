#ifndef DEVSTS_SOAP_PRESENTED_TOKEN_H
#define DEVSTS_SOAP_PRESENTED_TOKEN_H

#include <libxml/tree.h>

#include <optional>
#include <string>
#include <vector>

#include "soap/assertion_writer.h"

namespace DevSts {

// What an assertion that somebody presents says about itself.
struct PresentedToken {
  std::string id;
  std::string subject;
  std::vector<DelegateEntry> delegates;
  Time notBefore;
  Time notOnOrAfter;
  std::optional<std::string> holderCertificatePem;  // of a holder-of-key token
  unsigned proxyCount = 0;                          // 0: not delegable
  std::optional<RenewRestriction> renewal;

  // The one who may use the token: the last delegate, else the subject.
  const std::string& Bearer() const { return delegates.empty() ? subject : delegates.back().name; }
};

// Reads an assertion; `place` names it in faults ("The ActAs token"). Says nothing of whether the
// token is to be believed. Throws Fault.
PresentedToken ReadPresentedToken(xmlNode* assertion, const std::string& place);

// PEM of the certificate that SubjectConfirmationData names (SAML 2.0 Profiles, section 3.1).
// Throws Fault if the assertion is not a holder-of-key one.
std::string HolderCertificateOf(xmlNode* assertion, const std::string& place);

}  // namespace DevSts

#endif
