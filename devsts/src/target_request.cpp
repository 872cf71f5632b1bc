#include "target_request.h"

#include <string>
#include <tuple>

#include "element_reader.h"
#include "issue_request.h"
#include "namespaces.h"

namespace DevSts {
namespace {

xmlNode* OnlyAssertionIn(xmlNode* target) {
  RequireAttributes(target, {});
  ElementReader reader(target);
  xmlNode* assertion = reader.Expect(kSamlNamespace, "Assertion");
  reader.End();
  return assertion;
}

}  // namespace

RenewRequest ReadRenewRequest(xmlNode* requestSecurityToken) {
  RequireAttributes(requestSecurityToken, {});
  ElementReader reader(requestSecurityToken);
  RenewRequest request;
  RequireText(reader.Expect(kTrustNamespace, "TokenType"), kSamlNamespace);
  RequireRequestType(reader.Expect(kTrustNamespace, "RequestType"),
                     std::string(kTrustNamespace) + "/Renew");
  xmlNode* lifetime = reader.Expect(kTrustNamespace, "Lifetime");
  RequireAttributes(lifetime, {});
  std::tie(request.created, request.expires) = ReadPeriod(lifetime);
  request.target = OnlyAssertionIn(reader.Expect(kTrustNamespace, "RenewTarget"));
  reader.End();
  return request;
}

xmlNode* ReadValidateRequest(xmlNode* requestSecurityToken) {
  RequireAttributes(requestSecurityToken, {});
  ElementReader reader(requestSecurityToken);
  RequireText(reader.Expect(kTrustNamespace, "TokenType"),
              std::string(kTrustNamespace) + "/RSTR/Status");
  RequireRequestType(reader.Expect(kTrustNamespace, "RequestType"),
                     std::string(kTrustNamespace) + "/Validate");
  xmlNode* assertion = OnlyAssertionIn(reader.Expect(kTrustNamespace, "ValidateTarget"));
  reader.End();
  return assertion;
}

}  // namespace DevSts
