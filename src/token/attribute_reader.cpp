#include "token/attribute_reader.h"

#include "token/attribute_rules.h"
#include "token/element_rules.h"
#include "token/saml_names.h"

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

}  // namespace SsoClient
