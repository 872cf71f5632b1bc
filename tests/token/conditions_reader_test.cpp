#include "token/conditions_reader.h"

#include <string>
#include <tuple>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/assertion_text.h"
#include "support/fragment.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

constexpr char kUnknownOrDuplicate[] = "Unknown or duplicate restriction node under Conditions";
constexpr char kAudiences[] =
    "<saml2:AudienceRestriction><saml2:Audience>urn:b</saml2:Audience>"
    "<saml2:Audience>urn:a</saml2:Audience></saml2:AudienceRestriction>";
constexpr char kProxy[] = R"(<saml2:ProxyRestriction Count="3"/>)";
constexpr char kRenew[] =
    R"(<saml2:Condition xsi:type="rsa:RenewRestrictionType" Count="5" Postdatable="1" )"
    R"(RenewExpired="FALSE"/>)";
constexpr char kDelegation[] =
    R"(<saml2:Condition xsi:type="del:DelegationRestrictionType">)"
    R"(<del:Delegate DelegationInstant="2024-03-05T07:08:09Z"><saml2:NameID )"
    R"(Format="http://schemas.xmlsoap.org/claims/UPN">one@d</saml2:NameID></del:Delegate>)"
    R"(<del:Delegate DelegationInstant="2024-03-05T07:08:10Z"><saml2:NameID )"
    R"(Format="http://schemas.xmlsoap.org/claims/UPN">two@d</saml2:NameID></del:Delegate>)"
    R"(</saml2:Condition>)";

std::string ConditionsText(const std::string& restrictions) {
  return R"(<saml2:Conditions NotBefore="2024-03-05T07:00:00Z" )"
         R"(NotOnOrAfter="2024-03-05T08:00:00Z">)" +
         restrictions + "</saml2:Conditions>";
}

ParsedConditions ReadText(const std::string& text) {
  Fragment fragment(text);
  ParsedConditions conditions = ReadConditions(fragment.Cursor());
  EXPECT_TRUE(fragment.Cursor().IsAtEnd());
  return conditions;
}

ParsedConditions Read(const std::string& restrictions) {
  return ReadText(ConditionsText(restrictions));
}

std::string Refusal(const std::string& restrictions) {
  return ThrownMessage<ParseException>([&] { Read(restrictions); });
}

TEST(ReadConditionsTest, ReadsOnlyThePeriod) {
  const ParsedConditions conditions = Read(" <!--none--> ");
  EXPECT_EQ(conditions.notBefore.ToString(), "2024-03-05T07:00:00.000Z");
  EXPECT_EQ(conditions.notOnOrAfter.ToString(), "2024-03-05T08:00:00.000Z");
  EXPECT_FALSE(conditions.audiences.has_value());
  EXPECT_FALSE(conditions.renewRestriction.has_value());
  EXPECT_FALSE(conditions.proxyCount.has_value());
  EXPECT_FALSE(conditions.delegationChain.has_value());
}

TEST(ReadConditionsTest, ReadsEveryRestrictionInAnyOrder) {
  const std::string forwards = std::string(kAudiences) + kProxy + kRenew + kDelegation;
  const std::string backwards = std::string(kDelegation) + kRenew + kProxy + kAudiences;
  for (const std::string& text : {forwards, backwards}) {
    const ParsedConditions conditions = Read(text);
    EXPECT_EQ(conditions.audiences, (std::vector<std::string>{"urn:b", "urn:a"}));
    EXPECT_EQ(conditions.proxyCount, 3U);
    ASSERT_TRUE(conditions.renewRestriction.has_value());
    EXPECT_EQ(conditions.renewRestriction->count, 5U);
    EXPECT_TRUE(conditions.renewRestriction->postdatable);
    EXPECT_FALSE(conditions.renewRestriction->renewExpired);
    ASSERT_TRUE(conditions.delegationChain.has_value());
    ASSERT_EQ(conditions.delegationChain->size(), 2U);
    EXPECT_EQ(conditions.delegationChain->front().delegate.name, "one");
    EXPECT_EQ(conditions.delegationChain->front().delegate.domain, "d");
    EXPECT_EQ(conditions.delegationChain->front().delegationInstant.ToString(),
              "2024-03-05T07:08:09.000Z");
    EXPECT_EQ(conditions.delegationChain->back().delegate.name, "two");
    EXPECT_EQ(conditions.delegationChain->back().delegationInstant.ToString(),
              "2024-03-05T07:08:10.000Z");
  }
}

TEST(ReadConditionsTest, RefusesEachRestrictionTwice) {
  for (const std::string restriction : {kAudiences, kProxy, kRenew, kDelegation}) {
    EXPECT_EQ(Refusal(restriction + restriction), kUnknownOrDuplicate);
  }
}

// A restriction with a count of 0 is a restriction that was read.
TEST(ReadConditionsTest, RefusesASecondRestrictionAfterACountOfZero) {
  const std::string proxy = Replaced(kProxy, R"("3")", R"("0")");
  EXPECT_EQ(Read(proxy).proxyCount, 0U);
  EXPECT_EQ(Refusal(proxy + kProxy), kUnknownOrDuplicate);
  const std::string renew = Replaced(kRenew, R"("5")", R"("0")");
  ASSERT_TRUE(Read(renew).renewRestriction.has_value());
  EXPECT_EQ(Read(renew).renewRestriction->count, 0U);
  EXPECT_EQ(Refusal(renew + kRenew), kUnknownOrDuplicate);
}

TEST(ReadConditionsTest, RefusesASecondRestrictionBeforeItsContentIsRead) {
  const std::pair<const char*, const char*> cases[] = {
      {kAudiences, "<saml2:AudienceRestriction x=\"\"/>"},
      {kProxy, "<saml2:ProxyRestriction/>"},
      {kRenew, R"(<saml2:Condition xsi:type="rsa:RenewRestrictionType"/>)"},
      {kDelegation, R"(<saml2:Condition xsi:type="del:DelegationRestrictionType"/>)"}};
  for (const auto& [first, second] : cases) {
    EXPECT_EQ(Refusal(std::string(first) + second), kUnknownOrDuplicate) << second;
  }
}

TEST(ReadConditionsTest, RefusesUnknownNodes) {
  for (const char* restriction :
       {"<saml2:OneTimeUse/>", "text", "<?pi?>", "<ds:ProxyRestriction Count=\"1\"/>",
        "<ProxyRestriction Count=\"1\"/>", "<saml2:Condition/>",
        "<saml2:Condition type=\"rsa:RenewRestrictionType\" Count=\"1\"/>",
        "<saml2:Condition xsi:type=\"RenewRestrictionType\" Count=\"1\"/>",
        "<saml2:Condition xsi:type=\"saml2:RenewRestrictionType\" Count=\"1\"/>",
        "<saml2:Condition xsi:type=\"del:RenewRestrictionType\" Count=\"1\"/>",
        "<saml2:Condition xsi:type=\"rsa:DelegationRestrictionType\"/>",
        "<saml2:Condition xsi:type=\"rsa:renewrestrictiontype\" Count=\"1\"/>"}) {
    EXPECT_EQ(Refusal(restriction), kUnknownOrDuplicate) << restriction;
  }
}

TEST(ReadConditionsTest, RefusesATypeOfAnUndefinedPrefix) {
  EXPECT_EQ(ThrownMessage<ParseException>([] {
              Fragment fragment(
                  "\n<saml2:Conditions NotBefore=\"2024-03-05T07:00:00Z\" "
                  "NotOnOrAfter=\"2024-03-05T08:00:00Z\">\n"
                  " <saml2:Condition xsi:type=\"no:T\"/></saml2:Conditions>");
              ReadConditions(fragment.Cursor());
            }),
            "Element saml2:Conditionat 3,2 uses undefined prefix: `no'");
}

TEST(ReadConditionsTest, IdentifiesConditionsByTheTypesExpandedName) {
  const ParsedConditions conditions =
      Read(R"(<saml2:Condition i:type="RenewRestrictionType" Count="5" xmlns="http://sts-vendor.)"
           R"(example/names/2009/12/std-ext/SAML2.0" )"
           R"(xmlns:i="http://www.w3.org/2001/XMLSchema-instance"/>)");
  ASSERT_TRUE(conditions.renewRestriction.has_value());
  EXPECT_FALSE(conditions.renewRestriction->postdatable);
  EXPECT_FALSE(conditions.renewRestriction->renewExpired);
}

TEST(ReadConditionsTest, ReadsTheTypeWithoutTheWhiteSpaceAroundIt) {
  const std::string padded = Replaced(kRenew, "\"rsa:Renew", "\"&#10; rsa:Renew");
  EXPECT_TRUE(Read(padded).renewRestriction.has_value());
  EXPECT_EQ(Refusal(padded + kRenew), kUnknownOrDuplicate);
  EXPECT_EQ(Refusal(Replaced(kRenew, "rsa:Renew", "rsa: Renew")), kUnknownOrDuplicate);
}

TEST(ReadConditionsTest, RefusesMissingOrBrokenTimes) {
  const std::string text = ConditionsText("");
  const std::tuple<const char*, const char*, const char*> cases[] = {
      {R"( NotBefore="2024-03-05T07:00:00Z")", "",
       "Node 'saml2:Conditions is missing required attribute 'NotBefore'"},
      {R"( NotOnOrAfter="2024-03-05T08:00:00Z")", "",
       "Node 'saml2:Conditions is missing required attribute 'NotOnOrAfter'"},
      {R"( NotBefore="2024-03-05T07:00:00Z" NotOnOrAfter="2024-03-05T08:00:00Z")", "",
       "Node 'saml2:Conditions is missing required attribute 'NotBefore'"},
      {"2024-03-05T07:00:00Z", "now", "saml2:Conditions/@NotBefore is not a date"},
      {"2024-03-05T08:00:00Z", "", "saml2:Conditions/@NotOnOrAfter is not a date"},
      {"<saml2:Conditions ", "<saml2:Conditions Id=\"i\" ",
       "Unexpected attributes on element 'saml2:Conditions'"}};
  for (const auto& [from, to, message] : cases) {
    const std::string edited = Replaced(text, from, to);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadText(edited); }), message);
  }
}

TEST(ReadConditionsTest, RefusesBrokenAudiences) {
  EXPECT_EQ(Refusal("<saml2:AudienceRestriction/>"), "Expected element 'Audience' not found.");
  EXPECT_EQ(Refusal("<saml2:AudienceRestriction><saml2:Audience>a</saml2:Audience>b"
                    "</saml2:AudienceRestriction>"),
            "Expected element 'Audience' not found.");
  EXPECT_EQ(Refusal("<saml2:AudienceRestriction><Audience>a</Audience>"
                    "</saml2:AudienceRestriction>"),
            "Element 'Audience' has unexpected namespace");
  EXPECT_EQ(Refusal("<saml2:AudienceRestriction><saml2:Audience>a<!--b-->c</saml2:Audience>"
                    "</saml2:AudienceRestriction>"),
            "Element 'saml2:Audience' must only have textual content (but has extra children or is "
            "empty).");
  EXPECT_EQ(Refusal("<saml2:AudienceRestriction a=\"\"/>"),
            "Unexpected attributes on element 'saml2:AudienceRestriction'");
  EXPECT_EQ(Refusal("<saml2:AudienceRestriction><saml2:Audience a=\"\">b</saml2:Audience>"
                    "</saml2:AudienceRestriction>"),
            "Unexpected attributes on element 'saml2:Audience'");
}

TEST(ReadConditionsTest, RefusesBrokenProxyRestriction) {
  EXPECT_EQ(Refusal("<saml2:ProxyRestriction/>"),
            "Node 'saml2:ProxyRestriction is missing required attribute 'Count'");
  EXPECT_EQ(Refusal(R"(<saml2:ProxyRestriction Count="-1"/>)"),
            "saml2:ProxyRestriction/@Count is not a non-negative integer.");
  EXPECT_EQ(Refusal(R"(<saml2:ProxyRestriction Count="1" x=""/>)"),
            "Unexpected attributes on element 'saml2:ProxyRestriction'");
  EXPECT_EQ(Refusal(R"(<saml2:ProxyRestriction Count="1"><saml2:Audience>a</saml2:Audience>)"
                    R"(</saml2:ProxyRestriction>)"),
            "Element 'saml2:ProxyRestriction' must be empty");
}

TEST(ReadConditionsTest, RefusesBrokenRenewRestriction) {
  const std::string text = kRenew;
  EXPECT_EQ(Refusal(Replaced(text, R"( Count="5")", "")),
            "Node 'saml2:Condition is missing required attribute 'Count'");
  EXPECT_EQ(Refusal(Replaced(text, R"("5")", R"("-1")")),
            "saml2:Condition/@Count is not a non-negative integer.");
  EXPECT_EQ(Refusal(Replaced(text, R"("1")", R"("yes")")),
            "saml2:Condition/@Postdatable is not a Boolean");
  EXPECT_EQ(Refusal(Replaced(text, "FALSE", "no")),
            "saml2:Condition/@RenewExpired is not a Boolean");
  EXPECT_EQ(Refusal(Replaced(text, " Count", " x=\"\" Count")),
            "Unexpected attribute 'x' on element 'saml2:Condition'");
  EXPECT_EQ(Refusal(Replaced(text, "/>", "><x/></saml2:Condition>")),
            "Element 'saml2:Condition' must be empty");
}

TEST(ReadConditionsTest, RefusesBrokenDelegationRestriction) {
  EXPECT_EQ(Refusal(R"(<saml2:Condition xsi:type="del:DelegationRestrictionType"/>)"),
            "Expected element 'Delegate' not found.");
  const std::string open = R"(<saml2:Condition xsi:type="del:DelegationRestrictionType">)";
  const std::string nameId =
      R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">a@b</saml2:NameID>)";
  const std::string instant = R"( DelegationInstant="2024-03-05T07:08:09Z")";
  const auto refusal = [&](const std::string& content) {
    return Refusal(open + content + "</saml2:Condition>");
  };
  EXPECT_EQ(refusal("<del:Delegate>" + nameId + "</del:Delegate>"),
            "Node 'del:Delegate is missing required attribute 'DelegationInstant'");
  EXPECT_EQ(refusal("<del:Delegate DelegationInstant=\"\">" + nameId + "</del:Delegate>"),
            "del:Delegate/@DelegationInstant is not a date");
  EXPECT_EQ(refusal("<del:Delegate x=\"\"" + instant + ">" + nameId + "</del:Delegate>"),
            "Unexpected attributes on element 'del:Delegate'");
  EXPECT_EQ(refusal("<del:Delegate" + instant + "/>"), "Expected element 'NameID' not found.");
  EXPECT_EQ(
      refusal("<del:Delegate" + instant + ">" + Replaced(nameId, "a@b", "ab") + "</del:Delegate>"),
      "Failed to parse the UPN NameID: `ab'; name or domain part is missing.");
  EXPECT_EQ(refusal("<del:Delegate" + instant + ">" + nameId + nameId + "</del:Delegate>"),
            "Element 'del:Delegate' must be empty");
  EXPECT_EQ(refusal("<saml2:Delegate" + instant + ">" + nameId + "</saml2:Delegate>"),
            "Element 'saml2:Delegate' has unexpected namespace");
  EXPECT_EQ(refusal("<del:Delegate" + instant + ">" + nameId + "</del:Delegate>x"),
            "Expected element 'Delegate' not found.");
  EXPECT_EQ(Refusal(Replaced(kDelegation, "RestrictionType\"", "RestrictionType\" Count=\"1\"")),
            "Unexpected attribute 'Count' on element 'saml2:Condition'");
}

TEST(ReadConditionsTest, ReportsTheFirstOfTwoFaultsInConditions) {
  const std::string start = R"( NotBefore="2024-03-05T07:00:00Z")";
  const std::string end = R"( NotOnOrAfter="2024-03-05T08:00:00Z")";
  const std::pair<std::string, const char*> cases[] = {
      {"x=\"\"" + end, "Node 'saml2:Conditions is missing required attribute 'NotBefore'"},
      {"x=\"\"" + start, "Node 'saml2:Conditions is missing required attribute 'NotOnOrAfter'"},
      {"x=\"\" NotBefore=\"now\"" + end, "Unexpected attributes on element 'saml2:Conditions'"},
      {R"(NotOnOrAfter="later" NotBefore="now")", "saml2:Conditions/@NotBefore is not a date"},
      {"NotOnOrAfter=\"later\"" + start, "saml2:Conditions/@NotOnOrAfter is not a date"}};
  for (const auto& [attributes, message] : cases) {
    const std::string text = "<saml2:Conditions " + attributes + "><x/></saml2:Conditions>";
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadText(text); }), message);
  }
  EXPECT_EQ(Refusal("<saml2:ProxyRestriction/><x/>"),
            "Node 'saml2:ProxyRestriction is missing required attribute 'Count'");
  EXPECT_EQ(Refusal("<x/><saml2:ProxyRestriction/>"), kUnknownOrDuplicate);
}

TEST(ReadConditionsTest, ReportsTheFirstOfTwoFaultsInARestriction) {
  const std::pair<std::string, const char*> cases[] = {
      {R"(<saml2:AudienceRestriction><saml2:Audience x=""/></saml2:AudienceRestriction>)",
       "Unexpected attributes on element 'saml2:Audience'"},
      {R"(<saml2:AudienceRestriction><saml2:Audience/><x/></saml2:AudienceRestriction>)",
       "Element 'saml2:Audience' must only have textual content (but has extra children or is "
       "empty)."},
      {R"(<saml2:ProxyRestriction x=""/>)",
       "Node 'saml2:ProxyRestriction is missing required attribute 'Count'"},
      {R"(<saml2:ProxyRestriction Count="-1" x=""/>)",
       "Unexpected attributes on element 'saml2:ProxyRestriction'"},
      {R"(<saml2:ProxyRestriction Count="-1"><x/></saml2:ProxyRestriction>)",
       "saml2:ProxyRestriction/@Count is not a non-negative integer."},
      {R"(<saml2:Condition x=""/>)", kUnknownOrDuplicate}};
  for (const auto& [restriction, message] : cases) {
    EXPECT_EQ(Refusal(restriction), message) << restriction;
  }
}

TEST(ReadConditionsTest, ReportsTheFirstOfTwoFaultsInARenewRestriction) {
  const std::pair<const char*, const char*> cases[] = {
      {R"(x="" Postdatable="yes")", "Node 'saml2:Condition is missing required attribute 'Count'"},
      {R"(Count="-1" x="")", "Unexpected attribute 'x' on element 'saml2:Condition'"},
      {R"(RenewExpired="no" Postdatable="yes" Count="-1")",
       "saml2:Condition/@Count is not a non-negative integer."},
      {R"(RenewExpired="no" Postdatable="yes" Count="1")",
       "saml2:Condition/@Postdatable is not a Boolean"},
      {R"(RenewExpired="no" Count="1")", "saml2:Condition/@RenewExpired is not a Boolean"},
      {R"(Count="-1")", "saml2:Condition/@Count is not a non-negative integer."}};
  for (const auto& [attributes, message] : cases) {
    EXPECT_EQ(Refusal(std::string(R"(<saml2:Condition xsi:type="rsa:RenewRestrictionType" )") +
                      attributes + "><x/></saml2:Condition>"),
              message)
        << attributes;
  }
}

TEST(ReadConditionsTest, ReportsTheFirstOfTwoFaultsInADelegationRestriction) {
  const std::string open = R"(<saml2:Condition xsi:type="del:DelegationRestrictionType">)";
  const std::string close = "</saml2:Condition>";
  EXPECT_EQ(Refusal(Replaced(open, ">", " x=\"\">") + close),
            "Unexpected attribute 'x' on element 'saml2:Condition'");
  const std::string nameId =
      R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">a@b</saml2:NameID>)";
  const std::string instant = R"(<del:Delegate DelegationInstant="2024-03-05T07:08:09Z">)";
  const std::pair<std::string, const char*> cases[] = {
      {"<del:Delegate x=\"\"/>",
       "Node 'del:Delegate is missing required attribute 'DelegationInstant'"},
      {R"(<del:Delegate x="" DelegationInstant="now"/>)",
       "Unexpected attributes on element 'del:Delegate'"},
      {"<del:Delegate DelegationInstant=\"now\"/>",
       "del:Delegate/@DelegationInstant is not a date"},
      {instant + Replaced(nameId, "a@b", "ab") + "<x/></del:Delegate>",
       "Failed to parse the UPN NameID: `ab'; name or domain part is missing."},
      {instant + nameId + "<x/></del:Delegate><y/>", "Element 'del:Delegate' must be empty"}};
  for (const auto& [content, message] : cases) {
    EXPECT_EQ(Refusal(open + content + close), message) << content;
  }
}

}  // namespace
}  // namespace SsoClient::Testing
