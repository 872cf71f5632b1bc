#ifndef DEVSTS_ISSUE_REQUEST_H
#define DEVSTS_ISSUE_REQUEST_H

#include <libxml/tree.h>

#include <chrono>
#include <optional>
#include <string>
#include <utility>
#include <vector>

#include "binary_exchange.h"
#include "time_text.h"

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
  bool usesKey = false;  // wst:UseKey names the request's signature (WS-Trust 1.3, section 9.2)
  std::optional<NegotiationLeg> leg;  // the first one of a negotiation
};

// Throws Fault for anything missing, unknown or out of order.
IssueRequest ReadIssueRequest(xmlNode* requestSecurityToken, const std::string& vendorHost);

// wsu:Created and wsu:Expires of a Timestamp or Lifetime.
std::pair<Time, Time> ReadPeriod(xmlNode* element);

}  // namespace DevSts

#endif
