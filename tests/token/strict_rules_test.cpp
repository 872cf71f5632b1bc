#include "token/strict_rules.h"

#include <locale>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/system/date_time.h>

#include "support/fragment.h"
#include "support/thrown_message.h"
#include "support/token_edits.h"

namespace SsoClient::Testing {
namespace {

constexpr char kSaml[] = "urn:oasis:names:tc:SAML:2.0:assertion";

TEST(ExpectElementTest, AcceptsNameAndNamespaceUnderAnyPrefix) {
  for (const char* content : {"<saml2:A/>", R"(<A xmlns="urn:oasis:names:tc:SAML:2.0:assertion"/>)",
                              R"(<x:A xmlns:x="urn:oasis:names:tc:SAML:2.0:assertion"/>)"}) {
    const Fragment fragment(content);
    EXPECT_EQ(&ExpectElement(&fragment.Element(), "A", kSaml), &fragment.Element());
  }
}

TEST(ExpectElementTest, RejectsMissingNodeTextAndOtherName) {
  const std::string expected = "Expected element 'A' not found.";
  EXPECT_EQ(ThrownMessage<ParseException>([] { ExpectElement(nullptr, "A", kSaml); }), expected);
  for (const char* content : {"A", "<saml2:B/>", "<saml2:a/>", "<?A?>"}) {
    const Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>(
                  [&] { ExpectElement(fragment.Root().FirstChild(), "A", kSaml); }),
              expected);
  }
}

TEST(ExpectElementTest, RejectsOtherNamespaceAndNamesTheElement) {
  const Fragment prefixed("<ds:A/>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ExpectElement(&prefixed.Element(), "A", kSaml); }),
            "Element 'ds:A' has unexpected namespace");
  const Fragment plain("<A/>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ExpectElement(&plain.Element(), "A", kSaml); }),
            "Element 'A' has unexpected namespace");
  const Fragment fake(R"(<saml2:A xmlns:saml2="urn:oasis:names:tc:SAML:2.0:assertion "/>)");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ExpectElement(&fake.Element(), "A", kSaml); }),
            "Element 'saml2:A' has unexpected namespace");
}

TEST(ExpectEmptyTest, AcceptsWhiteSpaceAndComments) {
  Fragment fragment("<saml2:A> <!--c-->\n</saml2:A>");
  EXPECT_NO_THROW(ExpectEmpty(fragment.Cursor().Into(fragment.Element())));
}

TEST(ExpectEmptyTest, RejectsWhatIsLeft) {
  for (const char* content :
       {"<saml2:A><b/></saml2:A>", "<saml2:A>x</saml2:A>", "<saml2:A><?pi?></saml2:A>"}) {
    Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>(
                  [&] { ExpectEmpty(fragment.Cursor().Into(fragment.Element())); }),
              "Element 'saml2:A' must be empty");
  }
}

TEST(ReadTextContentTest, ReturnsTheTextUnchanged) {
  EXPECT_EQ(ReadTextContent(Fragment("<a>text</a>").Element()), "text");
  EXPECT_EQ(ReadTextContent(Fragment("<a> \n</a>").Element()), " \n");
  EXPECT_EQ(ReadTextContent(Fragment("<a>a<![CDATA[<b]]>&amp;c</a>").Element()), "a<b&c");
}

TEST(ReadTextContentTest, RejectsAnythingButOneText) {
  for (const char* content : {"<saml2:A/>", "<saml2:A></saml2:A>", "<saml2:A><b/></saml2:A>",
                              "<saml2:A>x<b/></saml2:A>", "<saml2:A>x<!--c-->y</saml2:A>",
                              "<saml2:A>x<!--c--></saml2:A>", "<saml2:A><!--c-->x</saml2:A>",
                              "<saml2:A>x<?pi?>y</saml2:A>", "<saml2:A><!--c--></saml2:A>"}) {
    const Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadTextContent(fragment.Element()); }),
              "Element 'saml2:A' must only have textual content (but has extra children or is "
              "empty).")
        << content;
  }
}

TEST(CheckAttributesTest, AcceptsRequiredOptionalAndNamespaceDeclarations) {
  const Fragment fragment(R"(<saml2:A c="" b="" a="" xmlns="urn:x" xmlns:y="urn:y"/>)");
  EXPECT_NO_THROW(CheckAttributes(fragment.Element(), {"a", "b"}, {"c", "d"}));
}

TEST(CheckAttributesTest, NamesTheFirstMissingOneInListOrder) {
  const Fragment fragment(R"(<saml2:A b="" extra=""/>)");
  EXPECT_EQ(ThrownMessage<ParseException>([&] {
              CheckAttributes(fragment.Element(), {"b", "c", "a"});
            }),
            "Node 'saml2:A is missing required attribute 'c'");
}

TEST(CheckAttributesTest, RejectsWhatIsLeft) {
  for (const char* content :
       {R"(<saml2:A a="" b=""/>)", R"(<saml2:A a="" ds:a=""/>)", R"(<saml2:A a="" xmlnsx=""/>)",
        R"(<saml2:A a="" xml:lang="en"/>)", R"(<saml2:A a="" xsi:type="xs:string"/>)"}) {
    const Fragment fragment(content);
    EXPECT_EQ(
        ThrownMessage<ParseException>([&] { CheckAttributes(fragment.Element(), {"a"}, {"c"}); }),
        "Unexpected attributes on element 'saml2:A'")
        << content;
  }
}

TEST(CheckAttributesTest, DoesNotAcceptAPrefixedAttributeAsTheRequiredOne) {
  const Fragment fragment(R"(<saml2:A saml2:a=""/>)");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { CheckAttributes(fragment.Element(), {"a"}); }),
            "Node 'saml2:A is missing required attribute 'a'");
}

TEST(CheckEachAttributeTest, FindsTypeUnderAnyPrefix) {
  const Fragment fragment(
      R"(<A s:type="x" Count="1" xmlns:s="http://www.w3.org/2001/XMLSchema-instance"/>)");
  EXPECT_NO_THROW(CheckEachAttribute(fragment.Element(), {kTypeAttribute}, {{"", "Count"}}));
  EXPECT_EQ(FindTypeAttribute(fragment.Element()), "x");
}

TEST(CheckEachAttributeTest, NamesTheMissingOne) {
  const Fragment fragment(R"(<saml2:A type="x" extra=""/>)");
  EXPECT_EQ(ThrownMessage<ParseException>(
                [&] { CheckEachAttribute(fragment.Element(), {kTypeAttribute}); }),
            "Node 'saml2:A is missing required attribute 'xsi:type'");
  EXPECT_EQ(ThrownMessage<ParseException>([&] {
              CheckEachAttribute(fragment.Element(), {{"", "Count"}});
            }),
            "Node 'saml2:A is missing required attribute 'Count'");
}

TEST(CheckEachAttributeTest, NamesTheFirstFault) {
  const Fragment fragment(R"(<saml2:A b="" a="" xsi:nil="true"/>)");
  EXPECT_EQ(ThrownMessage<ParseException>([&] {
              CheckEachAttribute(fragment.Element(), {{"", "c"}, kTypeAttribute});
            }),
            "Node 'saml2:A is missing required attribute 'c'");
  EXPECT_EQ(ThrownMessage<ParseException>([&] {
              CheckEachAttribute(fragment.Element(), {kTypeAttribute, {"", "c"}});
            }),
            "Node 'saml2:A is missing required attribute 'xsi:type'");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { CheckEachAttribute(fragment.Element(), {}); }),
            "Unexpected attribute 'b' on element 'saml2:A'");
}

TEST(CheckEachAttributeTest, NamesTheUnexpectedOne) {
  const Fragment type(R"(<saml2:A xsi:type="x" type="y"/>)");
  EXPECT_EQ(
      ThrownMessage<ParseException>([&] { CheckEachAttribute(type.Element(), {kTypeAttribute}); }),
      "Unexpected attribute 'type' on element 'saml2:A'");
  const Fragment nil(R"(<saml2:A xsi:nil="true"/>)");
  EXPECT_EQ(ThrownMessage<ParseException>(
                [&] { CheckEachAttribute(nil.Element(), {}, {kTypeAttribute}); }),
            "Unexpected attribute 'xsi:nil' on element 'saml2:A'");
  const Fragment foreign(R"(<saml2:A Count="1" saml2:Count="2"/>)");
  EXPECT_EQ(ThrownMessage<ParseException>([&] {
              CheckEachAttribute(foreign.Element(), {{"", "Count"}});
            }),
            "Unexpected attribute 'saml2:Count' on element 'saml2:A'");
}

TEST(ReadAttributeTest, ReturnsTheValueOrNamesTheMissingOne) {
  const Fragment fragment(R"(<saml2:A a="x &amp; y"/>)");
  EXPECT_EQ(ReadAttribute(fragment.Element(), "a"), "x & y");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadAttribute(fragment.Element(), "b"); }),
            "Node 'saml2:A is missing required attribute 'b'");
}

Fragment WithValue(const std::string& value) {
  return Fragment("<saml2:A v=\"" + value + "\"/>");
}

class ReadDateAttributeValueTest : public testing::TestWithParam<DateText> {};

TEST_P(ReadDateAttributeValueTest, ReadsOrRefuses) {
  const Fragment fragment = WithValue(GetParam().text);
  if (!GetParam().canonical.empty()) {
    const auto time = ReadDateAttribute(fragment.Element(), "v");
    EXPECT_EQ(Tarnik::System::DateTimeFromUtc(time.GetUtcTime(), false).ToString(),
              GetParam().canonical);
    return;
  }
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadDateAttribute(fragment.Element(), "v"); }),
            "saml2:A/@v is not a date");
}

INSTANTIATE_TEST_SUITE_P(Dates, ReadDateAttributeValueTest, testing::ValuesIn(DateTexts()));

TEST(ReadDateAttributeTest, NamesAMissingAttribute) {
  const Fragment fragment = WithValue("x");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadDateAttribute(fragment.Element(), "w"); }),
            "Node 'saml2:A is missing required attribute 'w'");
}

class ReadCountAttributeValueTest : public testing::TestWithParam<CountText> {};

TEST_P(ReadCountAttributeValueTest, ReadsOrRefuses) {
  const Fragment fragment = WithValue(GetParam().text);
  if (GetParam().count) {
    EXPECT_EQ(ReadCountAttribute(fragment.Element(), "v"), *GetParam().count);
    return;
  }
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadCountAttribute(fragment.Element(), "v"); }),
            "saml2:A/@v is not a non-negative integer.");
}

INSTANTIATE_TEST_SUITE_P(Counts, ReadCountAttributeValueTest, testing::ValuesIn(CountTexts()));

// Groups digits like many locales.
class Grouping : public std::numpunct<char> {
  char do_thousands_sep() const override { return ','; }
  std::string do_grouping() const override { return "\3"; }
};

TEST(ReadCountAttributeTest, DoesNotFollowTheLocale) {
  const std::locale before = std::locale::global(std::locale(std::locale(), new Grouping));
  const Fragment fragment = WithValue("1,000");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadCountAttribute(fragment.Element(), "v"); }),
            "saml2:A/@v is not a non-negative integer.");
  std::locale::global(before);
}

TEST(ReadBooleanAttributeTest, ReadsBooleansInAnyLetterCase) {
  for (const char* text : {"true", "TRUE", "True", "tRuE", "1"}) {
    EXPECT_TRUE(ReadBooleanAttribute(WithValue(text).Element(), "v")) << text;
  }
  for (const char* text : {"false", "FALSE", "False", "0"}) {
    EXPECT_FALSE(ReadBooleanAttribute(WithValue(text).Element(), "v")) << text;
  }
}

TEST(ReadBooleanAttributeTest, RefusesAnythingElse) {
  for (const char* text : {"yes", "no", "", " true", "true ", "01", "t", "-1"}) {
    const Fragment fragment = WithValue(text);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadBooleanAttribute(fragment.Element(), "v"); }),
              "saml2:A/@v is not a Boolean")
        << text;
  }
}

}  // namespace
}  // namespace SsoClient::Testing
