#ifndef DEVSTS_SOAP_SECURITY_HEADER_H
#define DEVSTS_SOAP_SECURITY_HEADER_H

#include <optional>
#include <string>

#include <libxml/tree.h>

#include "xml/schema_values.h"

namespace DevSts {

struct UserNameToken {
  std::string userName;
  std::string password;
};

// The content of a request's wsse:Security. The nodes are owned by the request's document.
struct SecurityHeader {
  xmlNode* timestamp = nullptr;
  Time created;
  Time expires;
  std::optional<UserNameToken> userNameToken;
  xmlNode* assertion = nullptr;
  xmlNode* certificateToken = nullptr;
  xmlNode* signature = nullptr;
};

// Reads the SOAP Header's only entry (WS-Security 1.1, sections 5 to 8 and 10; UsernameToken
// Profile 1.1, section 3.1). Throws Fault.
SecurityHeader ReadSecurityHeader(xmlNode* soapHeader);

}  // namespace DevSts

#endif
