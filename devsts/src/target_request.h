#ifndef DEVSTS_TARGET_REQUEST_H
#define DEVSTS_TARGET_REQUEST_H

#include <libxml/tree.h>

#include "time_text.h"

namespace DevSts {

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
