#ifndef DEVSTS_OPERATIONS_OPERATIONS_H
#define DEVSTS_OPERATIONS_OPERATIONS_H

#include <chrono>
#include <optional>
#include <string>

#include "operations/accounts.h"
#include "operations/token_issuer.h"
#include "operations/token_store.h"
#include "soap/request_signature.h"
#include "soap/security_header.h"
#include "soap/soap_request.h"
#include "soap/token_request.h"

namespace DevSts {

// What the operations share.
struct ServiceParts {
  const std::chrono::seconds clockSkew;
  const IssuerIdentity identity;
  Accounts accounts;
  TokenStore tokens;
};

// A request whose envelope, header and signature were found right.
struct CheckedRequest {
  SoapRequest soap;
  SecurityHeader header;
  std::optional<KeyProof> proof;
  AssertionOptions shape;
  Time now;
};

// Reads an Issue request and judges all but who makes it. Throws Fault.
IssueRequest PrepareIssue(const CheckedRequest& request, const ServiceParts& parts);

// Issues to the user who logged in by a negotiation, which ends with this leg. Throws Fault.
std::string IssueTo(const std::string& userName, const IssueRequest& issue,
                    const CheckedRequest& request, ServiceParts& parts, const ServerLeg& leg);

// Each gives the answer's envelope or throws Fault.
std::string Issue(const IssueRequest& issue, const CheckedRequest& request, ServiceParts& parts);
std::string Renew(const CheckedRequest& request, ServiceParts& parts);

// An ID for a new assertion.
std::string MakeId();

// Issues an assertion of this content and remembers it.
std::string IssueAndRemember(TokenContent content, const CheckedRequest& request,
                             ServiceParts& parts, TokenAnswer kind, const ServerLeg& leg = {});

// The end of a token that begins at `from`.
Time GrantedEnd(Time from, std::chrono::milliseconds asked, const AssertionOptions& shape);

// WS-Trust 1.3, section 11, InvalidTimeRange.
void RequireSensibleLifetime(Time created, Time expires);

}  // namespace DevSts

#endif
