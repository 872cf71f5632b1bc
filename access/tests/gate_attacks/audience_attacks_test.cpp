// Tokens for services with similar names, and tokens that are valid or delegated for too long.
#include "gate_attacks/attack_fixture.h"

namespace SsoClient::Access::Testing {
namespace {

using std::chrono::hours;

class AudienceAttacksTest : public AttackFixture {
 protected:
  // Restricted to this audience only.
  Verdict CheckFor(const std::string& audience) const {
    AssertionText changed = text;
    changed.conditions =
        Replaced(changed.conditions, "<saml2:Audience>https://b.example</saml2:Audience>", "");
    changed.conditions = Replaced(changed.conditions, kAudience, audience);
    return Check(Signed(changed));
  }
};

TEST_F(AudienceAttacksTest, AreRefusedForNamesThatAreOnlySimilar) {
  ExpectAccepted(CheckFor(kAudience));
  for (const char* audience :
       {"https://a.example/", "https://a.example.evil.example", "https://a.example ",
        " https://a.example", "https://a.exampl", "https://A.example", "HTTPS://a.example",
        "http://a.example", "https://a.example/*", "*", "https://a.example:443",
        "https://a%2Eexample", "https://a.example&#10;"}) {
    ExpectRefused(CheckFor(audience), Reason::kWrongAudience, CheckKind::kAudience);
  }
}

TEST_F(AudienceAttacksTest, AreRefusedForAPrefixOfOurs) {
  config.audiences = {"https://a.example/service"};
  ExpectAccepted(CheckFor("https://a.example/service"));
  ExpectRefused(CheckFor("https://a.example"), Reason::kWrongAudience, CheckKind::kAudience);
  ExpectRefused(CheckFor("https://a.example/"), Reason::kWrongAudience, CheckKind::kAudience);
}

// All restrictions have to be satisfied (SAML 2.0 core, section 2.5.1.4), so a second one is not
// read as more audiences.
TEST_F(AudienceAttacksTest, AreRefusedWhenASecondRestrictionNamesUs) {
  AssertionText changed = text;
  const std::string restriction =
      "<saml2:AudienceRestriction><saml2:Audience>https://c.example</saml2:Audience>"
      "</saml2:AudienceRestriction>";
  ExpectAccepted(Check(Signed(changed)));
  changed.conditions = Replaced(changed.conditions, "<saml2:AudienceRestriction>",
                                restriction + "<saml2:AudienceRestriction>");
  ExpectRefused(Check(Signed(changed)), Reason::kBadLayout, CheckKind::kLayout);
}

TEST_F(AudienceAttacksTest, ATokenForAHundredYearsIsRefused) {
  constexpr long kHundredYears = 100L * 365 * 24 * 3600;
  const auto lasting = [this](long seconds) {
    using SsoClient::Testing::TimeText;
    AssertionText changed = text;
    const std::string end = TimeText(start, 3600);
    changed.subject = Replaced(changed.subject, end, TimeText(start, seconds));
    changed.conditions = Replaced(changed.conditions, end, TimeText(start, seconds));
    return Signed(changed);
  };
  const long longest = config.longestLifetime.count() - 60;
  ExpectAccepted(Check(lasting(longest)));
  ExpectRefused(Check(lasting(longest + 1)), Reason::kTooLongLived, CheckKind::kLifetime);
  ExpectRefused(Check(lasting(kHundredYears)), Reason::kTooLongLived, CheckKind::kLifetime);
}

std::string DelegateText(std::size_t number) {
  return R"(<del:Delegate DelegationInstant="2024-03-05T07:08:09Z">)"
         R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">d)" +
         std::to_string(number) + "@example.com</saml2:NameID></del:Delegate>";
}

// With `count` delegates.
AssertionText DelegatedBy(AssertionText text, std::size_t count) {
  std::string chain;
  for (std::size_t i = 1; i < count; ++i) {
    chain += DelegateText(i);
  }
  text.Delegate();
  const std::size_t begin = text.conditions.find("<del:Delegate ");
  const std::size_t last = text.conditions.rfind("<del:Delegate ");
  text.conditions.replace(begin, last - begin, chain);
  return text;
}

TEST_F(AudienceAttacksTest, ATokenThatWasDelegatedTooOftenIsRefused) {
  ExpectAccepted(Check(Signed(DelegatedBy(text, config.deepestDelegation))));
  ExpectRefused(Check(Signed(DelegatedBy(text, config.deepestDelegation + 1))),
                Reason::kTooDeeplyDelegated, CheckKind::kDelegation);
  const std::string fifty = Signed(DelegatedBy(text, 50));
  ExpectRefused(Check(fifty), Reason::kTooDeeplyDelegated, CheckKind::kDelegation);
  config.deepestDelegation = 50;
  ExpectAccepted(Check(fifty));
}

}  // namespace
}  // namespace SsoClient::Access::Testing
