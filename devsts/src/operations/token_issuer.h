#ifndef DEVSTS_OPERATIONS_TOKEN_ISSUER_H
#define DEVSTS_OPERATIONS_TOKEN_ISSUER_H

#include <string>

#include "soap/assertion_writer.h"
#include "soap/soap_answer.h"

namespace DevSts {

// The issuer's names and its signing credential.
struct IssuerIdentity {
  std::string issuer;
  std::string vendorHost;
  std::string solutionHost;
  Credential signing;
};

// An answer's envelope and the final ID of its assertion.
struct IssuedAnswer {
  std::string envelope;
  std::string assertionId;
};

// Makes the envelope of an answer with a signed assertion. The assertion is signed inside the
// envelope, so that the signature is valid there under inclusive canonical form, too.
IssuedAnswer IssueToken(const TokenContent& content, const AssertionOptions& shape,
                        const IssuerIdentity& identity, TokenAnswer kind,
                        const ServerLeg& leg = {});

}  // namespace DevSts

#endif
