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

// The state that the operations share.
struct ServiceParts {
  const std::chrono::seconds clockSkew;
  const IssuerIdentity identity;
  Accounts accounts;
  TokenStore tokens;
};

// A request whose envelope, header and signature have been checked.
struct CheckedRequest {
  SoapRequest soap;
  SecurityHeader header;
  std::optional<KeyProof> proof;
  AssertionOptions shape;
  Time now;
};

// Reads an Issue request and checks everything except the requester's identity. Throws Fault.
IssueRequest PrepareIssue(const CheckedRequest& request, const ServiceParts& parts);

// Issues a token to the user who has logged in by a negotiation with the last leg `leg`. Throws
// Fault.
std::string IssueTo(const std::string& userName, const IssueRequest& issue,
                    const CheckedRequest& request, ServiceParts& parts, const ServerLeg& leg);

// Each returns the answer's envelope or throws Fault.
std::string Issue(const IssueRequest& issue, const CheckedRequest& request, ServiceParts& parts);
std::string Renew(const CheckedRequest& request, ServiceParts& parts);

// An ID for a new assertion.
std::string MakeId();

// Issues an assertion with this content and stores it.
std::string IssueAndRemember(TokenContent content, const CheckedRequest& request,
                             ServiceParts& parts, TokenAnswer kind, const ServerLeg& leg = {});

// The end of the validity of a token that is valid from `from`.
Time GrantedEnd(Time from, std::chrono::milliseconds asked, const AssertionOptions& shape);

// Throws the fault InvalidTimeRange (WS-Trust 1.3, section 11) unless the lifetime is positive
// and ends after `earliestEnd`.
void RequireSensibleLifetime(Time created, Time expires, Time earliestEnd);

}  // namespace DevSts

#endif
