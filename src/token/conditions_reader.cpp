#include "token/conditions_reader.h"

#include <string>
#include <utility>

#include <ssoclient/exceptions.h>

#include "deployment.h"
#include "support/namespaces.h"
#include "token/name_id_reader.h"
#include "token/strict_rules.h"

namespace SsoClient {
namespace {

using Tarnik::Xml::ElementNode;

std::vector<std::string> ReadAudiences(const ElementNode& restriction, ChildCursor children) {
  CheckAttributes(restriction, {});
  std::vector<std::string> audiences;
  do {
    const ElementNode& audience = children.TakeElement("Audience", kSamlNamespace);
    CheckAttributes(audience, {});
    audiences.emplace_back(ReadTextContent(audience));
  } while (!children.IsAtEnd());
  return audiences;
}

std::uint32_t ReadProxyCount(const ElementNode& restriction, const ChildCursor& children) {
  CheckAttributes(restriction, {"Count"});
  const std::uint32_t count = ReadCountAttribute(restriction, "Count");
  ExpectEmpty(children);
  return count;
}

bool ReadFlag(const ElementNode& element, std::string_view name) {
  return element.FindAttribute(name) && ReadBooleanAttribute(element, name);
}

RenewRestriction ReadRenewRestriction(const ElementNode& condition, const ChildCursor& children) {
  CheckEachAttribute(condition, {kTypeAttribute, {"", "Count"}},
                     {{"", "Postdatable"}, {"", "RenewExpired"}});
  RenewRestriction restriction;
  restriction.count = ReadCountAttribute(condition, "Count");
  restriction.postdatable = ReadFlag(condition, "Postdatable");
  restriction.renewExpired = ReadFlag(condition, "RenewExpired");
  ExpectEmpty(children);
  return restriction;
}

Delegate ReadDelegate(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("Delegate", kDelegationNamespace);
  CheckAttributes(element, {"DelegationInstant"});
  Delegate result;
  result.delegationInstant = ReadDateAttribute(element, "DelegationInstant");
  ChildCursor children = cursor.Into(element);
  result.delegate = ReadPrincipal(children);
  ExpectEmpty(children);
  return result;
}

std::vector<Delegate> ReadDelegationChain(const ElementNode& condition, ChildCursor children) {
  CheckEachAttribute(condition, {kTypeAttribute});
  std::vector<Delegate> chain;
  do {
    chain.push_back(ReadDelegate(children));
  } while (!children.IsAtEnd());
  return chain;
}

[[noreturn]] void FailUnknownOrDuplicate() {
  throw ParseException("Unknown or duplicate restriction node under Conditions");
}

// Condition is abstract (SAML 2.0 core, section 2.5.1.3): xsi:type names its concrete type.
void ReadTypedCondition(const ElementNode& condition, const ChildCursor& children,
                        ParsedConditions& conditions) {
  const std::optional<std::string_view> typeName = FindTypeAttribute(condition);
  if (!typeName) {
    FailUnknownOrDuplicate();
  }
  const QNameView type = ResolveQNameValue(condition, *typeName);
  if (type == QNameView{kVendorSamlNamespace, "RenewRestrictionType"} &&
      !conditions.renewRestriction) {
    conditions.renewRestriction = ReadRenewRestriction(condition, children);
    return;
  }
  if (type == QNameView{kDelegationNamespace, "DelegationRestrictionType"} &&
      !conditions.delegationChain) {
    conditions.delegationChain = ReadDelegationChain(condition, children);
    return;
  }
  FailUnknownOrDuplicate();
}

void ReadRestriction(ChildCursor& cursor, ParsedConditions& conditions) {
  const ElementNode* element = AsElement(cursor.Current());
  if (element == nullptr || element->NamespaceUri() != kSamlNamespace) {
    FailUnknownOrDuplicate();
  }
  const ChildCursor children = cursor.Into(*element);
  const std::string_view name = element->LocalName();
  if (name == "AudienceRestriction" && !conditions.audiences) {
    conditions.audiences = ReadAudiences(*element, children);
  } else if (name == "ProxyRestriction" && !conditions.proxyCount) {
    conditions.proxyCount = ReadProxyCount(*element, children);
  } else if (name == "Condition") {
    ReadTypedCondition(*element, children, conditions);
  } else {
    FailUnknownOrDuplicate();
  }
  cursor.Advance();
}

}  // namespace

ParsedConditions ReadConditions(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("Conditions", kSamlNamespace);
  CheckAttributes(element, {"NotBefore", "NotOnOrAfter"});
  ParsedConditions conditions;
  conditions.notBefore = ReadDateAttribute(element, "NotBefore");
  conditions.notOnOrAfter = ReadDateAttribute(element, "NotOnOrAfter");
  ChildCursor children = cursor.Into(element);
  while (!children.IsAtEnd()) {
    ReadRestriction(children, conditions);
  }
  return conditions;
}

}  // namespace SsoClient
