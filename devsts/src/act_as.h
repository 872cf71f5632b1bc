#ifndef DEVSTS_ACT_AS_H
#define DEVSTS_ACT_AS_H

#include <libxml/tree.h>

#include <string>

#include "assertion_writer.h"

namespace DevSts {

// Makes `content` speak of the subject of a presented token (WS-Trust 1.4, section 9.3), with
// `requester` at the end of its delegation chain. The token must be ours, current, and delegable or
// already delegated to the requester. Throws Fault.
void ActAs(xmlNode* assertion, const std::string& requester, const std::string& signingPem,
           TokenContent& content);

}  // namespace DevSts

#endif
