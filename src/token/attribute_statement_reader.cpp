#include "token/attribute_statement_reader.h"

#include <string>

#include <ssoclient/exceptions.h>
#include <tarnik/text/string_util.h>

#include "deployment.h"
#include "token/attribute_reader.h"
#include "token/attribute_rules.h"
#include "token/element_rules.h"
#include "token/principal_parser.h"
#include "token/saml_names.h"

namespace SsoClient {
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
