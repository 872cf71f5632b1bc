#include "token/statement_readers.h"

#include <ssoclient/exceptions.h>

#include "support/parsed_xml.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using TestSupport::Fragment;
using TestSupport::ThrownMessage;

constexpr char kTextOnly[] =
    "Element 'saml2:AttributeValue' must only have textual content (but has extra children or is "
    "empty).";

TEST(ReadSamlAttribute, ReadsNamesAndValuesInOrder) {
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

TEST(ReadSamlAttribute, LeavesAbsentNamesEmpty) {
  Fragment fragment(R"(<saml2:Attribute Name="n"/>)");
  const AttributeView attribute = ReadSamlAttribute(fragment.Cursor());
  EXPECT_EQ(attribute.nameFormat, "");
  EXPECT_EQ(attribute.friendlyName, "");
  EXPECT_TRUE(attribute.values.empty());
}

TEST(ReadSamlAttribute, ReadsEmptyValuesOnlyWhenToldTo) {
  const std::string text =
      R"(<saml2:Attribute Name="n"><saml2:AttributeValue xsi:type="xs:string"/>)"
      R"(<saml2:AttributeValue>a</saml2:AttributeValue>)"
      R"(<saml2:AttributeValue></saml2:AttributeValue></saml2:Attribute>)";
  Fragment read(text);
  EXPECT_EQ(ReadSamlAttribute(read.Cursor(), EmptyValues::kRead).values,
            (std::vector<std::string_view>{"", "a", ""}));
  Fragment refused(text);
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadSamlAttribute(refused.Cursor()); }), kTextOnly);
}

TEST(ReadSamlAttribute, TakesOnlyAValueWithoutContentForEmpty) {
  for (const char* content : {"<!---->", "<?p?>", "<x/>", "<!---->a"}) {
    Fragment fragment(std::string("<saml2:Attribute Name=\"n\"><saml2:AttributeValue>") + content +
                      "</saml2:AttributeValue></saml2:Attribute>");
    EXPECT_EQ(ThrownMessage<ParseException>(
                  [&] { ReadSamlAttribute(fragment.Cursor(), EmptyValues::kRead); }),
              kTextOnly)
        << content;
  }
}

TEST(ReadSamlAttribute, RefusesByTheReadingRules) {
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
      {open + "<saml2:AttributeValue/>" + close, kTextOnly},
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

TEST(ReadSamlAttribute, RefusesATypeOfAnUndefinedPrefix) {
  Fragment fragment(
      "\n<saml2:Attribute Name=\"n\">\n"
      "<saml2:AttributeValue xsi:type=\"no:string\">v</saml2:AttributeValue></saml2:Attribute>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadSamlAttribute(fragment.Cursor()); }),
            "Element saml2:AttributeValueat 3,1 uses undefined prefix: `no'");
}

}  // namespace
}  // namespace SsoClient
