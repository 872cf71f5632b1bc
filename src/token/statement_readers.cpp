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

std::string_view ReadValueText(const ElementNode& element, EmptyValues emptyValues) {
  if (emptyValues == EmptyValues::kRead && element.FirstChild() == nullptr) {
    return {};
  }
  return ReadTextContent(element);
}

std::string_view ReadValue(ChildCursor& cursor, EmptyValues emptyValues) {
  const ElementNode& element = ExpectElement(cursor.Current(), "AttributeValue", kSamlNamespace);
  CheckEachAttribute(element, {}, {kTypeAttribute});
  CheckTypeIsNameable(element);
  const std::string_view value = ReadValueText(element, emptyValues);
  cursor.Advance();
  return value;
}

}  // namespace

AttributeView ReadSamlAttribute(ChildCursor& cursor, EmptyValues emptyValues) {
  const ElementNode& element = ExpectElement(cursor.Current(), "Attribute", kSamlNamespace);
  CheckAttributes(element, {"Name"}, {"NameFormat", "FriendlyName"});
  AttributeView attribute;
  attribute.name = ReadAttribute(element, "Name");
  attribute.nameFormat = element.FindAttribute("NameFormat").value_or("");
  attribute.friendlyName = element.FindAttribute("FriendlyName").value_or("");
  ChildCursor children = cursor.Into(element);
  while (!children.IsAtEnd()) {
    attribute.values.push_back(ReadValue(children, emptyValues));
  }
  cursor.Advance();
  return attribute;
}

namespace {

using Tarnik::Xml::ElementNode;

std::string_view ReadContextClass(ChildCursor& cursor) {
  const ElementNode& element =
      ExpectElement(cursor.Current(), "AuthnContextClassRef", kSamlNamespace);
  CheckAttributes(element, {});
  const std::string_view contextClass = ReadTextContent(element);
  cursor.Advance();
  return contextClass;
}

std::string_view ReadContext(ChildCursor& cursor) {
  const ElementNode& element = ExpectElement(cursor.Current(), "AuthnContext", kSamlNamespace);
  CheckAttributes(element, {});
  ChildCursor children = cursor.Into(element);
  const std::string_view contextClass = ReadContextClass(children);
  if (!children.IsAtEnd()) {
    throw ParseException("Unexpected elements after AuthnContextClassRef");
  }
  cursor.Advance();
  return contextClass;
}

}  // namespace

AuthnStatement ReadAuthnStatement(ChildCursor& cursor) {
  const ElementNode& element = ExpectElement(cursor.Current(), "AuthnStatement", kSamlNamespace);
  CheckAttributes(element, {"AuthnInstant"});
  AuthnStatement statement;
  statement.instant = ReadDateAttribute(element, "AuthnInstant");
  ChildCursor children = cursor.Into(element);
  statement.contextClass = ReadContext(children);
  if (!children.IsAtEnd()) {
    throw ParseException("Unexpected elements after AuthnContext");
  }
  cursor.Advance();
  return statement;
}

namespace {

constexpr std::string_view kGivenNameAttribute =
    "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/givenname";
constexpr std::string_view kSurnameAttribute =
    "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/surname";

using Values = std::vector<std::string_view>;

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

SubjectAttributes ReadAttributeStatement(ChildCursor& cursor) {
  const Tarnik::Xml::ElementNode& element =
      ExpectElement(cursor.Current(), "AttributeStatement", kSamlNamespace);
  CheckAttributes(element, {});
  SubjectAttributes result;
  ChildCursor children = cursor.Into(element);
  while (!children.IsAtEnd()) {
    ApplyAttribute(ReadSamlAttribute(children), result);
  }
  cursor.Advance();
  return result;
}

}  // namespace SsoClient
