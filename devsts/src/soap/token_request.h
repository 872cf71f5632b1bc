#ifndef DEVSTS_SOAP_TOKEN_REQUEST_H
#define DEVSTS_SOAP_TOKEN_REQUEST_H

#include <chrono>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include <libxml/tree.h>

#include "soap/binary_exchange.h"
#include "xml/schema_values.h"

namespace DevSts {

struct AdviceRequest {
  std::string source;
  std::vector<std::pair<std::string, std::vector<std::string>>> attributes;
};

// RequestSecurityToken of the Issue binding (WS-Trust 1.3, section 4.1).
struct IssueRequest {
  bool publicKey = false;
  Time created;
  Time expires;
  bool renewable = false;
  bool delegable = false;
  std::optional<std::string> delegateTo;
  xmlNode* actAs = nullptr;  // the assertion, owned by the request's document
  std::vector<std::string> audiences;
  std::vector<AdviceRequest> advice;
  bool usesKey = false;  // wst:UseKey refers to the request's signature (WS-Trust 1.3, section 9.2)
  std::optional<NegotiationLeg> leg;  // the first leg of a negotiation
};

// Throws Fault for anything missing, unknown or out of order.
IssueRequest ReadIssueRequest(xmlNode* requestSecurityToken, const std::string& vendorHost);

// RequestSecurityToken of the Renew binding (WS-Trust 1.3, section 5).
struct RenewRequest {
  Time created;
  Time expires;
  xmlNode* target = nullptr;  // the assertion, owned by the request's document
};

// Each throws Fault for anything missing, unknown or out of order.
RenewRequest ReadRenewRequest(xmlNode* requestSecurityToken);
// The assertion of the Validate binding (WS-Trust 1.3, section 7).
xmlNode* ReadValidateRequest(xmlNode* requestSecurityToken);

}  // namespace DevSts

#endif
