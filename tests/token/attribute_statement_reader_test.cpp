#include "token/statement_readers.h"

#include <ssoclient/exceptions.h>
#include <tarnik/xml/character_nodes.h>

#include "deployment.h"
#include "support/parsed_xml.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using TestSupport::Fragment;
using TestSupport::ThrownMessage;
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

SubjectAttributes Read(const std::string& attributes) {
  Fragment fragment("<saml2:AttributeStatement>" + attributes + "</saml2:AttributeStatement>");
  SubjectAttributes result = ReadAttributeStatement(fragment.Cursor());
  EXPECT_TRUE(fragment.Cursor().IsAtEnd());
  return result;
}

std::string Refusal(const std::string& attributes) {
  return ThrownMessage<ParseException>([&] { Read(attributes); });
}

std::vector<std::string> GroupTexts(const SubjectAttributes& attributes) {
  std::vector<std::string> texts;
  for (const PrincipalId& group : attributes.groups) {
    texts.push_back(group.domain + "|" + group.name);
  }
  return texts;
}

TEST(ReadAttributeStatement, NamesTheAttributesByTheDeploymentsHosts) {
  EXPECT_STREQ(kGroupIdentityAttribute,
               "http://sts-vendor.example/schemas/attr-names/2009/01/GroupIdentity");
  EXPECT_STREQ(kIsSolutionAttribute, "http://sso.example/schemas/attr-names/2011/07/isSolution");
}

TEST(ReadAttributeStatement, ReadsGroupsInOrder) {
  EXPECT_EQ(GroupTexts(Read(AttributeText(kGroupIdentityAttribute, {"D\\b", "E\\a"}))),
            (Values{"D|b", "E|a"}));
  EXPECT_EQ(GroupTexts(Read(AttributeText(kGroupIdentityAttribute, {"D\\b"}) +
                            AttributeText(kGroupIdentityAttribute, {"E\\a\\c"}))),
            (Values{"D|b", "E|a\\c"}));
  EXPECT_TRUE(Read(AttributeText(kGroupIdentityAttribute, {})).groups.empty());
}

TEST(ReadAttributeStatement, RefusesAGroupWithoutDomain) {
  EXPECT_EQ(Refusal(AttributeText(kGroupIdentityAttribute, {"D\\b", "staff"})),
            "Failed to parse Group Identity value: `staff'; domain or group missing");
}

TEST(ReadAttributeStatement, SetsTheSolutionFlagForTrueAlone) {
  for (const char* value : {"true", "TRUE", "True"}) {
    EXPECT_TRUE(Read(AttributeText(kIsSolutionAttribute, {value})).isSolution) << value;
  }
  for (const char* value : {"1", "true ", " true", "yes", "false", "truex", "\n"}) {
    EXPECT_FALSE(Read(AttributeText(kIsSolutionAttribute, {value})).isSolution) << value;
  }
  EXPECT_FALSE(Read("").isSolution);
}

TEST(ReadAttributeStatement, LetsALaterSolutionAttributeWin) {
  EXPECT_FALSE(Read(AttributeText(kIsSolutionAttribute, {"true"}) +
                    AttributeText(kIsSolutionAttribute, {"false"}))
                   .isSolution);
  EXPECT_TRUE(Read(AttributeText(kIsSolutionAttribute, {"false"}) +
                   AttributeText(kIsSolutionAttribute, {"true"}))
                  .isSolution);
}

TEST(ReadAttributeStatement, RefusesNoneOrSeveralSolutionValues) {
  EXPECT_EQ(Refusal(AttributeText(kIsSolutionAttribute, {})),
            "No value found for attribute isSolution.");
  EXPECT_EQ(Refusal(AttributeText(kIsSolutionAttribute, {"true", "true"})),
            "More than one value found for attribute isSolution.");
}

TEST(ReadAttributeStatement, TakesTheFirstValueOfNames) {
  const SubjectAttributes attributes =
      Read(AttributeText(kGivenName, {"Ada", "x"}) + AttributeText(kSurname, {"Byron", "y"}));
  EXPECT_EQ(attributes.names.givenName, "Ada");
  EXPECT_EQ(attributes.names.surname, "Byron");
}

TEST(ReadAttributeStatement, LeavesNamesEmptyWithoutValue) {
  const SubjectAttributes absent = Read("");
  EXPECT_EQ(absent.names.givenName, "");
  EXPECT_EQ(absent.names.surname, "");
  EXPECT_EQ(Read(AttributeText(kGivenName, {})).names.givenName, "");
}

TEST(ReadAttributeStatement, LetsLaterNamesWin) {
  EXPECT_EQ(
      Read(AttributeText(kSurname, {"a"}) + AttributeText(kSurname, {"b", "c"})).names.surname,
      "b");
  EXPECT_EQ(Read(AttributeText(kSurname, {"a"}) + AttributeText(kSurname, {})).names.surname, "");
}

TEST(ReadAttributeStatement, LeavesAttributesOfOtherNames) {
  const SubjectAttributes attributes =
      Read(AttributeText("urn:other", {"a", "b"}) +
           AttributeText("HTTP://schemas.xmlsoap.org/ws/2005/05/identity/claims/surname", {"x"}));
  EXPECT_TRUE(attributes.groups.empty());
  EXPECT_EQ(attributes.names.surname, "");
}

TEST(ReadAttributeStatement, RefusesEmptyValues) {
  for (const std::string name :
       {kGroupIdentityAttribute, kIsSolutionAttribute, kSurname, "urn:other"}) {
    EXPECT_EQ(Refusal(AttributeText(name, {""})),
              "Element 'saml2:AttributeValue' must only have textual content (but has extra "
              "children or is empty).");
  }
}

TEST(ReadAttributeStatement, RefusesByTheReadingRules) {
  EXPECT_EQ(Refusal("<saml2:EncryptedAttribute/>"), "Expected element 'Attribute' not found.");
  EXPECT_EQ(Refusal("text"), "Expected element 'Attribute' not found.");
  EXPECT_EQ(Refusal("<saml2:Attribute NameFormat=\"f\"/>"),
            "Node 'saml2:Attribute is missing required attribute 'Name'");
  Fragment attribute("<saml2:AttributeStatement x=\"\"/>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadAttributeStatement(attribute.Cursor()); }),
            "Unexpected attributes on element 'saml2:AttributeStatement'");
  Fragment space("<ds:AttributeStatement/>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadAttributeStatement(space.Cursor()); }),
            "Element 'ds:AttributeStatement' has unexpected namespace");
}

// A parsed element without characters has no text child; a tree that was built can have an empty
// one.
TEST(ReadAttributeStatement, DoesNotCountAnEmptyTextAsTrue) {
  Fragment fragment("<saml2:AttributeStatement>" + AttributeText(kIsSolutionAttribute, {"true"}) +
                    "</saml2:AttributeStatement>");
  auto* value = TestSupport::FindElement(&fragment.Root(), "AttributeValue");
  static_cast<Tarnik::Xml::TextNode*>(value->FirstChild())->SetText("");
  EXPECT_FALSE(ReadAttributeStatement(fragment.Cursor()).isSolution);
}

}  // namespace
}  // namespace SsoClient
