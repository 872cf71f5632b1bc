#include "token_layout.h"
#include "value_model.h"

namespace Fuzz {
namespace {

const std::string kClaims = "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/";
const std::string kGroups = "http://sts-vendor.example/schemas/attr-names/2009/01/GroupIdentity";
const std::string kSolution = "http://sso.example/schemas/attr-names/2011/07/isSolution";

std::string ValueOf(const xmlNode* element) {
  DemandAttributes(element, {}, {kTypeAttribute});
  return ChildrenOf(element).empty() ? std::string() : OnlyTextOf(element);
}

ModelAttribute AttributeIn(const xmlNode* element) {
  DemandAttributes(element, {"Name"}, {"NameFormat", "FriendlyName"});
  ModelAttribute attribute{*AttributeOf(element, "Name"), {}};
  for (Contents contents(element); !contents.IsAtEnd();) {
    attribute.values.push_back(ValueOf(contents.Take("AttributeValue")));
  }
  return attribute;
}

ModelPrincipal GroupOf(const std::string& value) {
  const std::size_t backslash = value.find('\\');
  Demand(backslash != std::string::npos && backslash > 0 && backslash + 1 < value.size());
  return {value.substr(backslash + 1), value.substr(0, backslash)};
}

void ReadClaim(const ModelAttribute& attribute, ModelToken& token) {
  const std::string first = attribute.values.empty() ? "" : attribute.values.front();
  if (attribute.name == kGroups) {
    for (const std::string& value : attribute.values) {
      token.groups.push_back(GroupOf(value));
    }
  } else if (attribute.name == kSolution) {
    Demand(attribute.values.size() == 1);
    token.isSolution = LowerCaseOf(first) == "true";
  } else if (attribute.name == kClaims + "givenname") {
    token.givenName = first;
  } else if (attribute.name == kClaims + "surname") {
    token.surname = first;
  }
}

}  // namespace

void ReadAdvice(const xmlNode* advice, ModelToken& token) {
  DemandAttributes(advice, {});
  for (Contents contents(advice); !contents.IsAtEnd();) {
    const xmlNode* block = contents.Take("RSAAdvice", kVendorTypes);
    DemandAttributes(block, {"AdviceSource"});
    ModelAdvice read{*AttributeOf(block, "AdviceSource"), {}};
    for (Contents inner(block); !inner.IsAtEnd();) {
      read.attributes.push_back(AttributeIn(inner.Take("Attribute")));
    }
    token.advice.push_back(read);
  }
}

void ReadAuthnStatement(const xmlNode* statement) {
  DemandAttributes(statement, {"AuthnInstant"});
  DateAttributeOf(statement, "AuthnInstant");
  Contents contents(statement);
  const xmlNode* context = contents.Take("AuthnContext");
  contents.DemandEnd();
  DemandAttributes(context, {});
  Contents inner(context);
  const xmlNode* classRef = inner.Take("AuthnContextClassRef");
  inner.DemandEnd();
  DemandAttributes(classRef, {});
  OnlyTextOf(classRef);
}

void ReadAttributeStatement(const xmlNode* statement, ModelToken& token) {
  DemandAttributes(statement, {});
  for (Contents contents(statement); !contents.IsAtEnd();) {
    ReadClaim(AttributeIn(contents.Take("Attribute")), token);
  }
}

}  // namespace Fuzz
