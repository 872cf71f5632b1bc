#include "token/statement_readers.h"

#include <string>
#include <string_view>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/principal_id.h>
#include <tarnik/xml/character_nodes.h>

#include "deployment.h"
#include "support/assertion_text.h"
#include "support/fragment.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

constexpr char kTextOnly[] =
    "Element 'saml2:AttributeValue' must only have textual content (but has extra children or is "
    "empty).";

TEST(ReadSamlAttributeTest, ReadsNamesAndValuesInOrder) {
  Fragment fragment(
      R"(<saml2:Attribute Name="n" NameFormat="f" FriendlyName="g">)"
      R"(<saml2:AttributeValue xsi:type="xs:string">b</saml2:AttributeValue> <!--c-->)"
      R"(<saml2:AttributeValue>a</saml2:AttributeValue></saml2:Attribute><next/>)");
  const AttributeView attribute = ReadSamlAttribute(fragment.Cursor());
  EXPECT_EQ(attribute.name, "n");
  EXPECT_EQ(attribute.nameFormat, "f");
  EXPECT_EQ(attribute.friendlyName, "g");
  EXPECT_EQ(attribute.values, (std::vector<std::string_view>{"b", "a"}));
  EXPECT_TRUE(fragment.Cursor().IsAtElement("next"));
}

TEST(ReadSamlAttributeTest, LeavesAbsentNamesEmpty) {
  Fragment fragment(R"(<saml2:Attribute Name="n"/>)");
  const AttributeView attribute = ReadSamlAttribute(fragment.Cursor());
  EXPECT_EQ(attribute.nameFormat, "");
  EXPECT_EQ(attribute.friendlyName, "");
  EXPECT_TRUE(attribute.values.empty());
}

TEST(ReadSamlAttributeTest, ReadsValuesWithoutContentAsEmptyTexts) {
  Fragment fragment(
      R"(<saml2:Attribute Name="n"><saml2:AttributeValue xsi:type="xs:string"/>)"
      R"(<saml2:AttributeValue>a</saml2:AttributeValue>)"
      R"(<saml2:AttributeValue></saml2:AttributeValue>)"
      R"(<saml2:AttributeValue><![CDATA[]]></saml2:AttributeValue></saml2:Attribute>)");
  EXPECT_EQ(ReadSamlAttribute(fragment.Cursor()).values,
            (std::vector<std::string_view>{"", "a", "", ""}));
}

TEST(ReadSamlAttributeTest, TreatsOnlyAValueWithoutContentAsEmpty) {
  for (const char* content : {"<!---->", "<?p?>", "<x/>", "<!---->a"}) {
    Fragment fragment(std::string("<saml2:Attribute Name=\"n\"><saml2:AttributeValue>") + content +
                      "</saml2:AttributeValue></saml2:Attribute>");
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadSamlAttribute(fragment.Cursor()); }),
              kTextOnly)
        << content;
  }
}

TEST(ReadSamlAttributeTest, EnforcesTheReadingRules) {
  const std::string open = "<saml2:Attribute Name=\"n\">";
  const std::string close = "</saml2:Attribute>";
  const std::pair<std::string, std::string> cases[] = {
      {"<saml2:Attribute/>", "Node 'saml2:Attribute is missing required attribute 'Name'"},
      {"<saml2:Attribute Name=\"n\" x=\"\"/>",
       "Unexpected attributes on element 'saml2:Attribute'"},
      {"<ds:Attribute Name=\"n\"/>", "Element 'ds:Attribute' has unexpected namespace"},
      {"x", "Expected element 'Attribute' not found."},
      {open + "x" + close, "Expected element 'AttributeValue' not found."},
      {open + "<x/>" + close, "Expected element 'AttributeValue' not found."},
      {open + "<AttributeValue>v</AttributeValue>" + close,
       "Element 'AttributeValue' has unexpected namespace"},
      {open + "<saml2:AttributeValue><x/></saml2:AttributeValue>" + close, kTextOnly},
      {open + "<saml2:AttributeValue>a<!---->b</saml2:AttributeValue>" + close, kTextOnly},
      {open + "<saml2:AttributeValue>a<?p?>b</saml2:AttributeValue>" + close, kTextOnly},
      {open + "<saml2:AttributeValue xsi:nil=\"1\">v</saml2:AttributeValue>" + close,
       "Unexpected attribute 'xsi:nil' on element 'saml2:AttributeValue'"},
      {open + "<saml2:AttributeValue type=\"xs:string\">v</saml2:AttributeValue>" + close,
       "Unexpected attribute 'type' on element 'saml2:AttributeValue'"}};
  for (const auto& [content, message] : cases) {
    Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadSamlAttribute(fragment.Cursor()); }),
              message);
  }
}

TEST(ReadSamlAttributeTest, DoesNotReadTheTypesOfValues) {
  for (const char* type : {"xs:string", "string", "no:string", "no:", ":", "", "a:b:c", " x y "}) {
    Fragment fragment(std::string("<saml2:Attribute Name=\"n\"><saml2:AttributeValue xsi:type=\"") +
                      type + "\">v</saml2:AttributeValue></saml2:Attribute>");
    EXPECT_EQ(ReadSamlAttribute(fragment.Cursor()).values, (std::vector<std::string_view>{"v"}))
        << type;
  }
}

TEST(ReadSamlAttributeTest, ReportsTheFirstOfTwoFaults) {
  const std::pair<const char*, const char*> cases[] = {
      {R"(<saml2:Attribute x=""/>)", "Node 'saml2:Attribute is missing required attribute 'Name'"},
      {R"(<saml2:Attribute Name="n" x=""><y/></saml2:Attribute>)",
       "Unexpected attributes on element 'saml2:Attribute'"},
      {R"(<saml2:Attribute Name="n"><saml2:AttributeValue x=""><y/></saml2:AttributeValue>)"
       R"(</saml2:Attribute>)",
       "Unexpected attribute 'x' on element 'saml2:AttributeValue'"},
      {R"(<saml2:Attribute Name="n"><saml2:AttributeValue><y/></saml2:AttributeValue><x/>)"
       R"(</saml2:Attribute>)",
       kTextOnly}};
  for (const auto& [content, message] : cases) {
    Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadSamlAttribute(fragment.Cursor()); }), message)
        << content;
  }
}

using Values = std::vector<std::string>;

constexpr char kGivenName[] = "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/givenname";
constexpr char kSurname[] = "http://schemas.xmlsoap.org/ws/2005/05/identity/claims/surname";

std::string AttributeText(const std::string& name, const Values& values) {
  std::string text = "<saml2:Attribute Name=\"" + name + "\">";
  for (const std::string& value : values) {
    text += "<saml2:AttributeValue>" + value + "</saml2:AttributeValue>";
  }
  return text + "</saml2:Attribute>";
}

SubjectAttributes ReadAttributes(const std::string& attributes) {
  Fragment fragment("<saml2:AttributeStatement>" + attributes + "</saml2:AttributeStatement>");
  SubjectAttributes result = ReadAttributeStatement(fragment.Cursor());
  EXPECT_TRUE(fragment.Cursor().IsAtEnd());
  return result;
}

std::string AttributesRefusal(const std::string& attributes) {
  return ThrownMessage<ParseException>([&] { ReadAttributes(attributes); });
}

std::vector<std::string> GroupTexts(const SubjectAttributes& attributes) {
  std::vector<std::string> texts;
  for (const PrincipalId& group : attributes.groups) {
    texts.push_back(group.domain + "|" + group.name);
  }
  return texts;
}

TEST(ReadAttributeStatementTest, NamesTheAttributesByTheDeploymentsHosts) {
  EXPECT_STREQ(kGroupIdentityAttribute,
               "http://sts-vendor.example/schemas/attr-names/2009/01/GroupIdentity");
  EXPECT_STREQ(kIsSolutionAttribute, "http://sso.example/schemas/attr-names/2011/07/isSolution");
}

TEST(ReadAttributeStatementTest, ReadsGroupsInOrder) {
  EXPECT_EQ(GroupTexts(ReadAttributes(AttributeText(kGroupIdentityAttribute, {"D\\b", "E\\a"}))),
            (Values{"D|b", "E|a"}));
  EXPECT_EQ(GroupTexts(ReadAttributes(AttributeText(kGroupIdentityAttribute, {"D\\b"}) +
                                      AttributeText(kGroupIdentityAttribute, {"E\\a\\c"}))),
            (Values{"D|b", "E|a\\c"}));
  EXPECT_TRUE(ReadAttributes(AttributeText(kGroupIdentityAttribute, {})).groups.empty());
}

TEST(ReadAttributeStatementTest, RefusesAGroupWithoutDomain) {
  EXPECT_EQ(AttributesRefusal(AttributeText(kGroupIdentityAttribute, {"D\\b", "staff"})),
            "Failed to parse Group Identity value: `staff'; domain or group missing");
}

TEST(ReadAttributeStatementTest, SetsTheSolutionFlagForTrueOnly) {
  for (const char* value : {"true", "TRUE", "True"}) {
    EXPECT_TRUE(ReadAttributes(AttributeText(kIsSolutionAttribute, {value})).isSolution) << value;
  }
  for (const char* value : {"1", "true ", " true", "yes", "false", "truex", "\n"}) {
    EXPECT_FALSE(ReadAttributes(AttributeText(kIsSolutionAttribute, {value})).isSolution) << value;
  }
  EXPECT_FALSE(ReadAttributes("").isSolution);
}

TEST(ReadAttributeStatementTest, UsesTheLastSolutionAttribute) {
  EXPECT_FALSE(ReadAttributes(AttributeText(kIsSolutionAttribute, {"true"}) +
                              AttributeText(kIsSolutionAttribute, {"false"}))
                   .isSolution);
  EXPECT_TRUE(ReadAttributes(AttributeText(kIsSolutionAttribute, {"false"}) +
                             AttributeText(kIsSolutionAttribute, {"true"}))
                  .isSolution);
}

TEST(ReadAttributeStatementTest, RequiresExactlyOneSolutionValue) {
  EXPECT_EQ(AttributesRefusal(AttributeText(kIsSolutionAttribute, {})),
            "No value found for attribute isSolution.");
  EXPECT_EQ(AttributesRefusal(AttributeText(kIsSolutionAttribute, {"true", "true"})),
            "More than one value found for attribute isSolution.");
}

TEST(ReadAttributeStatementTest, UsesTheFirstValueOfNames) {
  const SubjectAttributes attributes = ReadAttributes(AttributeText(kGivenName, {"Ada", "x"}) +
                                                      AttributeText(kSurname, {"Byron", "y"}));
  EXPECT_EQ(attributes.names.givenName, "Ada");
  EXPECT_EQ(attributes.names.surname, "Byron");
}

TEST(ReadAttributeStatementTest, LeavesNamesEmptyWithoutValue) {
  const SubjectAttributes absent = ReadAttributes("");
  EXPECT_EQ(absent.names.givenName, "");
  EXPECT_EQ(absent.names.surname, "");
  EXPECT_EQ(ReadAttributes(AttributeText(kGivenName, {})).names.givenName, "");
}

TEST(ReadAttributeStatementTest, UsesTheLastNames) {
  const auto names = [](const Values& first, const Values& second) {
    return ReadAttributes(AttributeText(kGivenName, first) + AttributeText(kSurname, first) +
                          AttributeText(kGivenName, second) + AttributeText(kSurname, second))
        .names;
  };
  EXPECT_EQ(names({"a"}, {"b", "c"}).givenName, "b");
  EXPECT_EQ(names({"a"}, {"b", "c"}).surname, "b");
  // An attribute without values resets the name.
  EXPECT_EQ(names({"a"}, {}).givenName, "");
  EXPECT_EQ(names({"a"}, {}).surname, "");
}

TEST(ReadAttributeStatementTest, IgnoresAttributesOfOtherNames) {
  const SubjectAttributes attributes = ReadAttributes(
      AttributeText("urn:other", {"a", "b"}) +
      AttributeText("HTTP://schemas.xmlsoap.org/ws/2005/05/identity/claims/surname", {"x"}));
  EXPECT_TRUE(attributes.groups.empty());
  EXPECT_EQ(attributes.names.surname, "");
}

TEST(ReadAttributeStatementTest, ReadsEmptyValuesAsEmptyTexts) {
  EXPECT_EQ(ReadAttributes(AttributeText(kGivenName, {"Ada"}) + AttributeText(kSurname, {""}))
                .names.surname,
            "");
  EXPECT_EQ(ReadAttributes(AttributeText(kSurname, {"a"}) + AttributeText(kSurname, {"", "b"}))
                .names.surname,
            "");
  EXPECT_EQ(ReadAttributes(AttributeText("urn:other", {"", "a"}) + AttributeText(kSurname, {"b"}))
                .names.surname,
            "b");
}

TEST(ReadAttributeStatementTest, ClearsTheSolutionFlagForAnEmptyValue) {
  EXPECT_FALSE(ReadAttributes(AttributeText(kIsSolutionAttribute, {"true"}) +
                              AttributeText(kIsSolutionAttribute, {""}))
                   .isSolution);
  EXPECT_EQ(AttributesRefusal(AttributeText(kIsSolutionAttribute, {"true", ""})),
            "More than one value found for attribute isSolution.");
}

TEST(ReadAttributeStatementTest, RefusesAGroupWithoutText) {
  EXPECT_EQ(AttributesRefusal(AttributeText(kGroupIdentityAttribute, {"D\\b", ""})),
            "Failed to parse Group Identity value: `'; domain or group missing");
}

TEST(ReadAttributeStatementTest, EnforcesTheReadingRules) {
  EXPECT_EQ(AttributesRefusal("<saml2:EncryptedAttribute/>"),
            "Expected element 'Attribute' not found.");
  EXPECT_EQ(AttributesRefusal("text"), "Expected element 'Attribute' not found.");
  EXPECT_EQ(AttributesRefusal("<saml2:Attribute NameFormat=\"f\"/>"),
            "Node 'saml2:Attribute is missing required attribute 'Name'");
  Fragment attribute("<saml2:AttributeStatement x=\"\"/>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadAttributeStatement(attribute.Cursor()); }),
            "Unexpected attributes on element 'saml2:AttributeStatement'");
  Fragment space("<ds:AttributeStatement/>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadAttributeStatement(space.Cursor()); }),
            "Element 'ds:AttributeStatement' has unexpected namespace");
}

// Each attribute is applied before the next one is read.
TEST(ReadAttributeStatementTest, ReportsTheFirstOfTwoFaults) {
  EXPECT_EQ(AttributesRefusal(AttributeText(kIsSolutionAttribute, {}) + "<x/>"),
            "No value found for attribute isSolution.");
  EXPECT_EQ(AttributesRefusal(AttributeText(kGroupIdentityAttribute, {"staff"}) +
                              AttributeText(kIsSolutionAttribute, {})),
            "Failed to parse Group Identity value: `staff'; domain or group missing");
  EXPECT_EQ(AttributesRefusal(AttributeText(kIsSolutionAttribute, {"true", "true", "<x/>"})),
            kTextOnly);
  Fragment both("<saml2:AttributeStatement x=\"\"><y/></saml2:AttributeStatement>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadAttributeStatement(both.Cursor()); }),
            "Unexpected attributes on element 'saml2:AttributeStatement'");
}

// A parsed element without characters has no text child, but an element of a tree that was built
// can have an empty one.
TEST(ReadAttributeStatementTest, DoesNotCountAnEmptyTextAsTrue) {
  Fragment fragment("<saml2:AttributeStatement>" + AttributeText(kIsSolutionAttribute, {"true"}) +
                    "</saml2:AttributeStatement>");
  auto* value = FindElement(&fragment.Root(), "AttributeValue");
  static_cast<Tarnik::Xml::TextNode*>(value->FirstChild())->SetText("");
  EXPECT_FALSE(ReadAttributeStatement(fragment.Cursor()).isSolution);
}

constexpr char kAuthnStatement[] =
    R"(<saml2:AuthnStatement AuthnInstant="2024-03-05T07:08:09Z"> <saml2:AuthnContext>)"
    R"(<saml2:AuthnContextClassRef>urn:class</saml2:AuthnContextClassRef><!--c-->)"
    R"(</saml2:AuthnContext></saml2:AuthnStatement>)";

std::string AuthnRefusal(const std::string& text) {
  Fragment fragment(text);
  return ThrownMessage<ParseException>([&] { ReadAuthnStatement(fragment.Cursor()); });
}

TEST(ReadAuthnStatementTest, ReadsInstantAndClass) {
  Fragment fragment(std::string(kAuthnStatement) + "<next/>");
  const AuthnStatement statement = ReadAuthnStatement(fragment.Cursor());
  EXPECT_EQ(statement.instant.ToString(), "2024-03-05T07:08:09.000Z");
  EXPECT_EQ(statement.contextClass, "urn:class");
  EXPECT_TRUE(fragment.Cursor().IsAtElement("next"));
}

TEST(ReadAuthnStatementTest, RefusesAnythingAfterAnExpectedChild) {
  for (const char* addition : {"<x/>", "text", "<?p?>"}) {
    EXPECT_EQ(
        AuthnRefusal(InsertedAfter(kAuthnStatement, "</saml2:AuthnContextClassRef>", addition)),
        "Unexpected elements after AuthnContextClassRef");
    EXPECT_EQ(AuthnRefusal(InsertedAfter(kAuthnStatement, "</saml2:AuthnContext>", addition)),
              "Unexpected elements after AuthnContext");
  }
}

TEST(ReadAuthnStatementTest, EnforcesTheReadingRules) {
  EXPECT_EQ(AuthnRefusal(Replaced(kAuthnStatement, R"( AuthnInstant="2024-03-05T07:08:09Z")", "")),
            "Node 'saml2:AuthnStatement is missing required attribute 'AuthnInstant'");
  EXPECT_EQ(AuthnRefusal(Replaced(kAuthnStatement, "2024-03-05T07:08:09Z", "now")),
            "saml2:AuthnStatement/@AuthnInstant is not a date");
  EXPECT_EQ(
      AuthnRefusal(Replaced(kAuthnStatement, " AuthnInstant", " SessionIndex=\"1\" AuthnInstant")),
      "Unexpected attributes on element 'saml2:AuthnStatement'");
  EXPECT_EQ(AuthnRefusal(
                Replaced(kAuthnStatement, "<saml2:AuthnContext>", "<saml2:AuthnContext x=\"\">")),
            "Unexpected attributes on element 'saml2:AuthnContext'");
  EXPECT_EQ(AuthnRefusal(Replaced(kAuthnStatement, "<saml2:AuthnContextClassRef>",
                                  "<saml2:AuthnContextClassRef x=\"\">")),
            "Unexpected attributes on element 'saml2:AuthnContextClassRef'");
  EXPECT_EQ(AuthnRefusal(Replaced(kAuthnStatement, "urn:class", "")),
            "Element 'saml2:AuthnContextClassRef' must only have textual content (but has extra "
            "children or is empty).");
  EXPECT_EQ(AuthnRefusal(Replaced(kAuthnStatement, "<saml2:AuthnContext>",
                                  "<saml2:SubjectLocality/>"
                                  "<saml2:AuthnContext>")),
            "Expected element 'AuthnContext' not found.");
  EXPECT_EQ(AuthnRefusal(
                Replaced(kAuthnStatement,
                         "<saml2:AuthnContextClassRef>urn:class</saml2:AuthnContextClassRef>", "")),
            "Expected element 'AuthnContextClassRef' not found.");
  EXPECT_EQ(AuthnRefusal("<ds:AuthnStatement/>"),
            "Element 'ds:AuthnStatement' has unexpected namespace");
}

TEST(ReadAuthnStatementTest, RefusesAMissingChild) {
  EXPECT_EQ(AuthnRefusal(R"(<saml2:AuthnStatement AuthnInstant="2024-03-05T07:08:09Z"/>)"),
            "Expected element 'AuthnContext' not found.");
  EXPECT_EQ(AuthnRefusal(R"(<saml2:AuthnStatement AuthnInstant="2024-03-05T07:08:09Z">)"
                         R"(<saml2:AuthnContext/></saml2:AuthnStatement>)"),
            "Expected element 'AuthnContextClassRef' not found.");
}

TEST(ReadAuthnStatementTest, ReportsTheFirstOfTwoFaults) {
  const std::string good = R"(AuthnInstant="2024-03-05T07:08:09Z")";
  const std::string context = "<saml2:AuthnContext>";
  const std::pair<std::string, std::string> attributes[] = {
      {"x=\"\"", "Node 'saml2:AuthnStatement is missing required attribute 'AuthnInstant'"},
      {"x=\"\" AuthnInstant=\"now\"", "Unexpected attributes on element 'saml2:AuthnStatement'"},
      {"AuthnInstant=\"now\"", "saml2:AuthnStatement/@AuthnInstant is not a date"}};
  for (const auto& [broken, message] : attributes) {
    EXPECT_EQ(AuthnRefusal("<saml2:AuthnStatement " + broken + "><x/></saml2:AuthnStatement>"),
              message);
  }
  const std::pair<std::string, std::string> contents[] = {
      {"<saml2:AuthnContext x=\"\"/>", "Unexpected attributes on element 'saml2:AuthnContext'"},
      {context + "<saml2:AuthnContextClassRef x=\"\"/></saml2:AuthnContext>",
       "Unexpected attributes on element 'saml2:AuthnContextClassRef'"},
      {context + "<saml2:AuthnContextClassRef/><x/></saml2:AuthnContext>",
       "Element 'saml2:AuthnContextClassRef' must only have textual content (but has extra "
       "children or is empty)."},
      {context + "<saml2:AuthnContextClassRef>c</saml2:AuthnContextClassRef><x/>"
                 "</saml2:AuthnContext><y/>",
       "Unexpected elements after AuthnContextClassRef"}};
  for (const auto& [broken, message] : contents) {
    EXPECT_EQ(
        AuthnRefusal("<saml2:AuthnStatement " + good + ">" + broken + "</saml2:AuthnStatement>"),
        message);
  }
}

}  // namespace
}  // namespace SsoClient::Testing
