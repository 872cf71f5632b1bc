#include "token_layout.h"

#include <algorithm>

#include "value_model.h"

namespace Fuzz {
namespace {

bool Contains(const std::vector<std::string>& names, const std::string& name) {
  return std::find(names.begin(), names.end(), name) != names.end();
}

std::string NameInLists(const XmlAttribute& attribute) {
  const bool isType = attribute.localName == "type" &&
                      attribute.space == "http://www.w3.org/2001/XMLSchema-instance";
  return isType ? kTypeAttribute : attribute.name;
}

}  // namespace

void DemandAttributes(const xmlNode* element, const std::vector<std::string>& required,
                      const std::vector<std::string>& optional) {
  std::vector<std::string> names;
  for (const XmlAttribute& attribute : AttributesOf(element)) {
    names.push_back(NameInLists(attribute));
    Demand(Contains(required, names.back()) || Contains(optional, names.back()));
  }
  for (const std::string& name : required) {
    Demand(Contains(names, name));
  }
}

void DemandNoContent(const xmlNode* element) {
  Demand(ContentOf(element).empty());
}

std::string OnlyTextOf(const xmlNode* element) {
  const std::vector<Item> children = ChildrenOf(element);
  Demand(children.size() == 1 && children.front().isText);
  return children.front().text;
}

long DateAttributeOf(const xmlNode* element, const std::string& name) {
  return Demanded(DateOf(Demanded(AttributeOf(element, name))));
}

std::optional<std::string> TypeOf(const xmlNode* element) {
  for (const XmlAttribute& attribute : AttributesOf(element)) {
    if (NameInLists(attribute) == kTypeAttribute) {
      return attribute.value;
    }
  }
  return std::nullopt;
}

bool IsNameOfType(const xmlNode* element, const std::string& written, const std::string& space,
                  const std::string& name) {
  const std::string value = Trimmed(written);
  const std::size_t colon = value.find(':');
  if (colon == std::string::npos) {
    return value == name && NamespaceBoundTo(element, "") == space;
  }
  return Demanded(NamespaceBoundTo(element, value.substr(0, colon))) == space &&
         value.substr(colon + 1) == name;
}

ModelPrincipal PrincipalOf(const xmlNode* nameId) {
  DemandAttributes(nameId, {"Format"});
  Demand(AttributeOf(nameId, "Format") == "http://schemas.xmlsoap.org/claims/UPN");
  const std::string name = OnlyTextOf(nameId);
  const std::size_t at = name.rfind('@');
  Demand(at != std::string::npos && at > 0 && at + 1 < name.size());
  return {name.substr(0, at), name.substr(at + 1)};
}

}  // namespace Fuzz
