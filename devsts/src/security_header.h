#ifndef DEVSTS_SECURITY_HEADER_H
#define DEVSTS_SECURITY_HEADER_H

#include <libxml/tree.h>

#include <string>

#include "time_text.h"

namespace DevSts {

// wsse:Security as it stands in a request made with a user's name and password.
struct SecurityHeader {
  Time created;
  Time expires;
  std::string userName;
  std::string password;
};

// Reads the SOAP Header's only entry (WS-Security 1.1, sections 5 and 10; UsernameToken
// Profile 1.1, section 3.1). Throws Fault.
SecurityHeader ReadSecurityHeader(xmlNode* soapHeader);

}  // namespace DevSts

#endif
