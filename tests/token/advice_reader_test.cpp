#include "token/advice_reader.h"

#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

#include "support/fragment.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

TEST(ReadAdviceTest, ReadsBlocksAttributesAndValuesInOrder) {
  Fragment fragment(
      R"(<saml2:Advice><rsa:RSAAdvice AdviceSource="urn:s"><saml2:Attribute Name="a">)"
      R"(<saml2:AttributeValue>1</saml2:AttributeValue>)"
      R"(<saml2:AttributeValue>2</saml2:AttributeValue></saml2:Attribute>)"
      R"(<saml2:Attribute Name="b" FriendlyName="f"/></rsa:RSAAdvice> <!--c-->)"
      R"(<rsa:RSAAdvice AdviceSource=""/></saml2:Advice><next/>)");
  const std::vector<Advice> advice = ReadAdvice(fragment.Cursor());
  ASSERT_EQ(advice.size(), 2U);
  EXPECT_EQ(advice[0].source, "urn:s");
  ASSERT_EQ(advice[0].attributes.size(), 2U);
  EXPECT_EQ(advice[0].attributes[0].name, "a");
  EXPECT_EQ(advice[0].attributes[0].values, (std::vector<std::string>{"1", "2"}));
  EXPECT_EQ(advice[0].attributes[1].name, "b");
  EXPECT_TRUE(advice[0].attributes[1].values.empty());
  EXPECT_EQ(advice[1].source, "");
  EXPECT_TRUE(advice[1].attributes.empty());
  EXPECT_TRUE(fragment.Cursor().IsAtElement("next"));
}

TEST(ReadAdviceTest, ReadsEmptyValuesAndNames) {
  Fragment fragment(
      R"(<saml2:Advice><rsa:RSAAdvice AdviceSource="urn:s"><saml2:Attribute Name="">)"
      R"(<saml2:AttributeValue xsi:type="xs:string"></saml2:AttributeValue>)"
      R"(<saml2:AttributeValue xsi:type="xs:string"> </saml2:AttributeValue>)"
      R"(<saml2:AttributeValue xsi:type="xs:string"/></saml2:Attribute></rsa:RSAAdvice>)"
      R"(</saml2:Advice>)");
  const std::vector<Advice> advice = ReadAdvice(fragment.Cursor());
  ASSERT_EQ(advice.size(), 1U);
  ASSERT_EQ(advice[0].attributes.size(), 1U);
  EXPECT_EQ(advice[0].attributes[0].name, "");
  EXPECT_EQ(advice[0].attributes[0].values, (std::vector<std::string>{"", " ", ""}));
}

TEST(ReadAdviceTest, ReadsNoAdvice) {
  Fragment fragment("<saml2:Advice/>");
  EXPECT_TRUE(ReadAdvice(fragment.Cursor()).empty());
}

TEST(ReadAdviceTest, EnforcesTheReadingRules) {
  const std::pair<const char*, const char*> cases[] = {
      {"<rsa:Advice/>", "Element 'rsa:Advice' has unexpected namespace"},
      {"<saml2:Advice x=\"\"/>", "Unexpected attributes on element 'saml2:Advice'"},
      {"<saml2:Advice><saml2:Assertion/></saml2:Advice>",
       "Expected element 'RSAAdvice' not found."},
      {"<saml2:Advice>x</saml2:Advice>", "Expected element 'RSAAdvice' not found."},
      {"<saml2:Advice><saml2:RSAAdvice AdviceSource=\"s\"/></saml2:Advice>",
       "Element 'saml2:RSAAdvice' has unexpected namespace"},
      {"<saml2:Advice><rsa:RSAAdvice/></saml2:Advice>",
       "Node 'rsa:RSAAdvice is missing required attribute 'AdviceSource'"},
      {"<saml2:Advice><rsa:RSAAdvice AdviceSource=\"s\" x=\"\"/></saml2:Advice>",
       "Unexpected attributes on element 'rsa:RSAAdvice'"},
      {"<saml2:Advice><rsa:RSAAdvice AdviceSource=\"s\"><rsa:Attribute Name=\"a\"/>"
       "</rsa:RSAAdvice></saml2:Advice>",
       "Element 'rsa:Attribute' has unexpected namespace"}};
  for (const auto& [content, message] : cases) {
    Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadAdvice(fragment.Cursor()); }), message);
  }
}

TEST(ReadAdviceTest, ReportsTheFirstOfTwoFaults) {
  const std::pair<const char*, const char*> cases[] = {
      {"<saml2:Advice x=\"\"><y/></saml2:Advice>",
       "Unexpected attributes on element 'saml2:Advice'"},
      {"<saml2:Advice><rsa:RSAAdvice x=\"\"/></saml2:Advice>",
       "Node 'rsa:RSAAdvice is missing required attribute 'AdviceSource'"},
      {"<saml2:Advice><rsa:RSAAdvice AdviceSource=\"s\" x=\"\"><y/></rsa:RSAAdvice></saml2:Advice>",
       "Unexpected attributes on element 'rsa:RSAAdvice'"},
      {"<saml2:Advice><rsa:RSAAdvice AdviceSource=\"s\"><saml2:Attribute x=\"\"/>"
       "</rsa:RSAAdvice><y/></saml2:Advice>",
       "Node 'saml2:Attribute is missing required attribute 'Name'"}};
  for (const auto& [content, message] : cases) {
    Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadAdvice(fragment.Cursor()); }), message)
        << content;
  }
}

}  // namespace
}  // namespace SsoClient::Testing
