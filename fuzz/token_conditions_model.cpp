#include "token_layout.h"
#include "value_model.h"

namespace Fuzz {
namespace {

unsigned long CountAttributeOf(const xmlNode* element) {
  return Demanded(CountOf(Demanded(AttributeOf(element, "Count"))));
}

void ReadAudiences(const xmlNode* restriction, ModelToken& token) {
  DemandAttributes(restriction, {});
  Contents contents(restriction);
  do {
    const xmlNode* audience = contents.Take("Audience");
    DemandAttributes(audience, {});
    token.audiences.insert(OnlyTextOf(audience));
  } while (!contents.IsAtEnd());
}

void ReadRenewRestriction(const xmlNode* condition, ModelToken& token) {
  DemandAttributes(condition, {kTypeAttribute, "Count"}, {"Postdatable", "RenewExpired"});
  token.renewals = CountAttributeOf(condition);
  for (const char* name : {"Postdatable", "RenewExpired"}) {
    if (const auto flag = AttributeOf(condition, name)) {
      Demand(BooleanOf(*flag).has_value());
    }
  }
  DemandNoContent(condition);
}

ModelDelegate DelegateIn(const xmlNode* element) {
  DemandAttributes(element, {"DelegationInstant"});
  Contents contents(element);
  const ModelPrincipal principal = PrincipalOf(contents.Take("NameID"));
  contents.DemandEnd();
  return {principal, DateAttributeOf(element, "DelegationInstant")};
}

void ReadDelegates(const xmlNode* condition, ModelToken& token) {
  DemandAttributes(condition, {kTypeAttribute});
  token.delegates.emplace();
  Contents contents(condition);
  do {
    token.delegates->push_back(DelegateIn(contents.Take("Delegate", kDelegation)));
  } while (!contents.IsAtEnd());
}

}  // namespace

void ReadConditions(const xmlNode* conditions, ModelToken& token) {
  DemandAttributes(conditions, {"NotBefore", "NotOnOrAfter"});
  token.notBefore = DateAttributeOf(conditions, "NotBefore");
  token.notOnOrAfter = DateAttributeOf(conditions, "NotOnOrAfter");
  std::set<std::string> seen;
  for (Contents contents(conditions); !contents.IsAtEnd();) {
    if (contents.IsAt("AudienceRestriction")) {
      Demand(seen.insert("audiences").second);
      ReadAudiences(contents.TakeAny(), token);
      continue;
    }
    if (contents.IsAt("ProxyRestriction")) {
      Demand(seen.insert("proxies").second);
      const xmlNode* restriction = contents.TakeAny();
      DemandAttributes(restriction, {"Count"});
      token.proxies = CountAttributeOf(restriction);
      DemandNoContent(restriction);
      continue;
    }
    const xmlNode* condition = contents.Take("Condition");
    const std::string type = Demanded(TypeOf(condition));
    if (IsNameOfType(condition, type, kVendorTypes, "RenewRestrictionType")) {
      Demand(seen.insert("renewals").second);
      ReadRenewRestriction(condition, token);
    } else {
      Demand(IsNameOfType(condition, type, kDelegation, "DelegationRestrictionType"));
      Demand(seen.insert("delegates").second);
      ReadDelegates(condition, token);
    }
  }
}

}  // namespace Fuzz
