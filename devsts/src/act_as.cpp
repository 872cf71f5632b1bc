#include "act_as.h"

#include "fault.h"
#include "namespaces.h"
#include "xml_library.h"
#include "xml_verifier.h"

namespace DevSts {
namespace {

xmlNode* Child(const xmlNode* parent, const char* namespaceUri, const char* localName) {
  for (xmlNode* child : ChildElements(parent)) {
    if (IsElement(child, namespaceUri, localName)) {
      return child;
    }
  }
  ThrowInvalidSecurityToken("The ActAs token has no " + std::string(localName));
}

Time TimeAttribute(const xmlNode* element, const char* name) {
  const std::optional<Time> time = TimeFromText(AttributeOf(element, name));
  if (!time) {
    ThrowInvalidSecurityToken("The ActAs token's " + std::string(name) + " is not a time");
  }
  return *time;
}

void RequireOurSignature(xmlNode* assertion, const std::string& signingPem) {
  RegisterIds(assertion->doc);
  const VerifyResult result =
      VerifySignature(Child(assertion, kDsigNamespace, "Signature"), signingPem);
  if (!result) {
    ThrowInvalidSecurityToken("The ActAs token's signature does not verify: " + result.reason);
  }
  const std::string own = "#" + AttributeOf(assertion, "ID");
  if (result.referenceUris != std::vector<std::string>{own}) {
    ThrowInvalidSecurityToken("The ActAs token's signature does not cover it");
  }
}

void RequireCurrent(const xmlNode* conditions, Time now) {
  if (TimeAttribute(conditions, "NotOnOrAfter") <= now) {
    ThrowInvalidSecurityToken("The ActAs token has expired");
  }
}

std::vector<DelegateEntry> DelegatesOf(xmlNode* conditions) {
  std::vector<DelegateEntry> delegates;
  for (const xmlNode* node : FindElements(conditions, kDelegationNamespace, "Delegate")) {
    delegates.push_back({ContentOf(Child(node, kSamlNamespace, "NameID")),
                         TimeAttribute(node, "DelegationInstant")});
  }
  return delegates;
}

bool IsDelegable(xmlNode* conditions) {
  const std::vector<xmlNode*> proxies =
      FindElements(conditions, kSamlNamespace, "ProxyRestriction");
  return !proxies.empty() && AttributeOf(proxies.front(), "Count") != "0";
}

}  // namespace

void ActAs(xmlNode* assertion, const std::string& requester, const std::string& signingPem,
           TokenContent& content) {
  xmlNode* conditions = Child(assertion, kSamlNamespace, "Conditions");
  const xmlNode* subject = Child(assertion, kSamlNamespace, "Subject");
  content.subject = ContentOf(Child(subject, kSamlNamespace, "NameID"));
  content.delegates = DelegatesOf(conditions);
  const bool delegable = IsDelegable(conditions);
  RequireCurrent(conditions, content.issued);
  RequireOurSignature(assertion, signingPem);

  const bool isDelegate = !content.delegates.empty() && content.delegates.back().name == requester;
  if (!isDelegate && !delegable) {
    ThrowInvalidRequest("The ActAs token may not be delegated to " + requester);
  }
  if (!isDelegate) {
    content.delegates.push_back({requester, content.issued});
  }
}

}  // namespace DevSts
