#ifndef DEVSTS_TOKEN_ISSUER_H
#define DEVSTS_TOKEN_ISSUER_H

#include <string>

#include "assertion_writer.h"

namespace DevSts {

// Who signs, and under which names.
struct IssuerIdentity {
  std::string issuer;
  std::string vendorHost;
  std::string solutionHost;
  Credential signing;
};

// Makes the envelope of an Issue answer with a signed assertion. The signature is made in its
// place, so that it holds there under inclusive canonical form, too.
std::string IssueToken(const TokenContent& content, const AssertionOptions& shape,
                       const IssuerIdentity& identity);

}  // namespace DevSts

#endif
