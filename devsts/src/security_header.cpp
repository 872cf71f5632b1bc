#include "security_header.h"

#include <tuple>

#include "element_reader.h"
#include "fault.h"
#include "issue_request.h"
#include "namespaces.h"
#include "xml_library.h"

namespace DevSts {
namespace {

constexpr char kPasswordText[] =
    "http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-username-token-profile-1.0#PasswordText";

xmlNode* OnlySecurity(xmlNode* soapHeader) {
  xmlNode* found = nullptr;
  for (xmlNode* child : ChildElements(soapHeader)) {
    if (!IsElement(child, kWsseNamespace, "Security")) {
      ThrowInvalidRequest("Unexpected header entry " + std::string(LocalName(child)));
    }
    if (found != nullptr) {
      ThrowInvalidSecurity("More than one Security header");
    }
    found = child;
  }
  if (found == nullptr) {
    ThrowInvalidSecurity("No Security header");
  }
  return found;
}

void ReadUsernameToken(xmlNode* token, SecurityHeader& header) {
  RequireAttributes(token, {});
  ElementReader reader(token);
  header.userName = PlainText(reader.Expect(kWsseNamespace, "Username"));
  const xmlNode* password = reader.Expect(kWsseNamespace, "Password");
  RequireAttributes(password, {{"Type"}});
  if (AttributeOf(password, "Type") != kPasswordText) {
    ThrowInvalidSecurity("Password/@Type is not PasswordText");
  }
  header.password = TextOf(password);
  reader.End();
}

}  // namespace

SecurityHeader ReadSecurityHeader(xmlNode* soapHeader) {
  xmlNode* security = OnlySecurity(soapHeader);
  RequireAttributes(security, {});
  ElementReader reader(security);
  SecurityHeader header;
  xmlNode* timestamp = reader.Optional(kWsuNamespace, "Timestamp");
  if (timestamp == nullptr) {
    ThrowInvalidSecurity("The Security header does not begin with a Timestamp");
  }
  RequireAttributes(timestamp, {});
  std::tie(header.created, header.expires) = ReadPeriod(timestamp);
  xmlNode* token = reader.Optional(kWsseNamespace, "UsernameToken");
  if (token == nullptr) {
    ThrowInvalidSecurity("No UsernameToken behind the Timestamp");
  }
  ReadUsernameToken(token, header);
  reader.End();
  return header;
}

}  // namespace DevSts
