#include "soap/security_header.h"

#include <tuple>

#include "soap/element_reader.h"
#include "soap/fault.h"
#include "xml/document.h"
#include "xml/namespaces.h"

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

UserNameToken ReadUsernameToken(xmlNode* element) {
  RequireAttributes(element, {});
  ElementReader reader(element);
  UserNameToken token;
  token.userName = PlainText(reader.Expect(kWsseNamespace, "Username"));
  const xmlNode* password = reader.Expect(kWsseNamespace, "Password");
  RequireAttributes(password, {{"Type"}});
  if (AttributeOf(password, "Type") != kPasswordText) {
    ThrowInvalidSecurity("Password/@Type is not PasswordText");
  }
  token.password = TextOf(password);
  reader.End();
  return token;
}

void ReadSignature(ElementReader& reader, SecurityHeader& header) {
  header.signature = reader.Optional(kDsigNamespace, "Signature");
  if (header.signature != nullptr && !reader.AtEnd()) {
    ThrowInvalidSecurity("The Signature is not the last element of Security");
  }
}

}  // namespace

SecurityHeader ReadSecurityHeader(xmlNode* soapHeader) {
  xmlNode* security = OnlySecurity(soapHeader);
  RequireAttributes(security, {});
  ElementReader reader(security);
  SecurityHeader header;
  header.timestamp = reader.Optional(kWsuNamespace, "Timestamp");
  if (header.timestamp == nullptr) {
    ThrowInvalidSecurity("The Security header does not begin with a Timestamp");
  }
  std::tie(header.created, header.expires) = ReadPeriod(header.timestamp);
  if (xmlNode* token = reader.Optional(kWsseNamespace, "UsernameToken")) {
    header.userNameToken = ReadUsernameToken(token);
  }
  header.assertion = reader.Optional(kSamlNamespace, "Assertion");
  header.certificateToken = reader.Optional(kWsseNamespace, "BinarySecurityToken");
  ReadSignature(reader, header);
  reader.End();
  return header;
}

}  // namespace DevSts
