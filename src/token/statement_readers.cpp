#include "token/statement_readers.h"

#include <string>

#include <ssoclient/exceptions.h>
#include <tarnik/text/string_util.h>

#include "deployment.h"
#include "support/namespaces.h"
#include "token/name_id_reader.h"
#include "token/strict_rules.h"

namespace SsoClient {

namespace {

using Tarnik::Xml::ElementNode;
using Values = std::vector<std::string_view>;

constexpr std::string_view kGivenNameAttribute =
    "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/givenname";
constexpr std::string_view kSurnameAttribute =
    "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/surname";

std::string_view ReadContextClass(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("AuthnContextClassRef", kSamlNamespace);
  CheckAttributes(element, {});
  return ReadTextContent(element);
}

std::string_view ReadContext(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("AuthnContext", kSamlNamespace);
  CheckAttributes(element, {});
  ChildCursor children = cursor.Into(element);
  const std::string_view contextClass = ReadContextClass(children);
  children.ExpectEnd("Unexpected elements after AuthnContextClassRef");
  return contextClass;
}

// A value is a text whatever its type, so xsi:type is not read.
std::string_view ReadValue(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("AttributeValue", kSamlNamespace);
  CheckEachAttribute(element, {}, {kTypeAttribute});
  return element.FirstChild() == nullptr ? std::string_view() : ReadTextContent(element);
}

void AppendGroups(const Values& values, std::vector<PrincipalId>& groups) {
  groups.reserve(groups.size() + values.size());
  for (const std::string_view value : values) {
    groups.push_back(PrincipalFromGroupIdentity(value));
  }
}

bool ParseIsSolution(const Values& values) {
  if (values.empty()) {
    throw ParseException("No value found for attribute isSolution.");
  }
  if (values.size() > 1) {
    throw ParseException("More than one value found for attribute isSolution.");
  }
  return Tarnik::StringUtil::ToLower(values.front()) == "true";
}

std::string FirstValue(const Values& values) {
  return values.empty() ? std::string() : std::string(values.front());
}

void ApplyAttribute(const AttributeView& attribute, SubjectAttributes& result) {
  if (attribute.name == kGroupIdentityAttribute) {
    AppendGroups(attribute.values, result.groups);
  } else if (attribute.name == kIsSolutionAttribute) {
    result.isSolution = ParseIsSolution(attribute.values);
  } else if (attribute.name == kGivenNameAttribute) {
    result.names.givenName = FirstValue(attribute.values);
  } else if (attribute.name == kSurnameAttribute) {
    result.names.surname = FirstValue(attribute.values);
  }
}

}  // namespace

AuthnStatement ReadAuthnStatement(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("AuthnStatement", kSamlNamespace);
  CheckAttributes(element, {"AuthnInstant"});
  AuthnStatement statement;
  statement.instant = ReadDateAttribute(element, "AuthnInstant");
  ChildCursor children = cursor.Into(element);
  statement.contextClass = ReadContext(children);
  children.ExpectEnd("Unexpected elements after AuthnContext");
  return statement;
}

SubjectAttributes ReadAttributeStatement(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("AttributeStatement", kSamlNamespace);
  CheckAttributes(element, {});
  SubjectAttributes result;
  ChildCursor children = cursor.Into(element);
  while (!children.IsAtEnd()) {
    ApplyAttribute(ReadSamlAttribute(children), result);
  }
  return result;
}

AttributeView ReadSamlAttribute(ChildCursor& cursor) {
  const ElementNode& element = cursor.TakeElement("Attribute", kSamlNamespace);
  CheckAttributes(element, {"Name"}, {"NameFormat", "FriendlyName"});
  AttributeView attribute;
  attribute.name = ReadAttribute(element, "Name");
  attribute.nameFormat = element.FindAttribute("NameFormat").value_or("");
  attribute.friendlyName = element.FindAttribute("FriendlyName").value_or("");
  ChildCursor children = cursor.Into(element);
  while (!children.IsAtEnd()) {
    attribute.values.push_back(ReadValue(children));
  }
  return attribute;
}

}  // namespace SsoClient
