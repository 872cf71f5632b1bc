#include "xml/builders.h"

#include <gmock/gmock.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/fake_saml_token.h"
#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(BuilderFactoriesTest, MakeElements) {
  EXPECT_EQ(Testing::BuiltXml(*MakeElementBuilder("a", "E")), "<a:E/>");
  EXPECT_EQ(Testing::BuiltXml(*MakeElementBuilder("a", "E", {{"z", "1"}, {"b", "2"}})),
            R"(<a:E b="2" z="1"/>)");
}

TEST(BuilderFactoriesTest, MakeTextElements) {
  EXPECT_EQ(Testing::BuiltXml(*MakeTextElementBuilder("a", "E", "text")), "<a:E>text</a:E>");
  EXPECT_EQ(Testing::BuiltXml(*MakeTextElementBuilder("a", "E", "text", {{"z", "1"}, {"b", "2"}})),
            R"(<a:E b="2" z="1">text</a:E>)");
}

TEST(BuilderFactoriesTest, AnAttributeGivenTwiceKeepsItsFirstValue) {
  EXPECT_EQ(Testing::BuiltXml(*MakeElementBuilder("a", "E", {{"n", "first"}, {"n", "second"}})),
            R"(<a:E n="first"/>)");
}

TEST(BuilderFactoriesTest, ATokenIsInsertedFromItsText) {
  const std::string assertion =
      R"(<saml2:Assertion xmlns:saml2="urn:s" ID="_1"><ds:Signature xmlns:ds="urn:d">QUJD)"
      "\n"
      R"(REVG</ds:Signature>  <!--kept--><saml2:Issuer b="2" a="1">i</saml2:Issuer>)"
      R"(</saml2:Assertion>)";
  const Testing::FakeSamlToken token("<?xml version=\"1.0\"?>\n" + assertion + "\n");
  auto parent = MakeCompositeBuilder("", "Parent");
  parent->Add(MakeTokenElementBuilder(token));
  EXPECT_EQ(Testing::BuiltXml(*parent), "<Parent>" + assertion + "</Parent>");
}

TEST(BuilderFactoriesTest, EveryBuildOfATokenHandsOutTheSameElement) {
  const auto builder = MakeTokenElementBuilder(Testing::FakeSamlToken("<A/>"));
  EXPECT_EQ(Testing::Built(*builder), Testing::Built(*builder));
  EXPECT_NE(Testing::Built(*builder),
            Testing::Built(*MakeTokenElementBuilder(Testing::FakeSamlToken("<A/>"))));
}

TEST(BuilderFactoriesTest, ATokenWithAMalformedTextIsRefused) {
  EXPECT_THROW(MakeTokenElementBuilder(Testing::FakeSamlToken("<A>")),
               Tarnik::Xml::XMLParseException);
  EXPECT_THROW(MakeTokenElementBuilder(Testing::FakeSamlToken("")), Tarnik::Xml::XMLParseException);
}

}  // namespace
}  // namespace SsoClient
