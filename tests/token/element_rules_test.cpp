#include "token/strict_rules.h"

#include <ssoclient/exceptions.h>

#include "support/parsed_xml.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using TestSupport::Fragment;
using TestSupport::ThrownMessage;

constexpr char kSaml[] = "urn:oasis:names:tc:SAML:2.0:assertion";

TEST(ExpectElement, AcceptsNameAndNamespaceUnderAnyPrefix) {
  for (const char* content : {"<saml2:A/>", R"(<A xmlns="urn:oasis:names:tc:SAML:2.0:assertion"/>)",
                              R"(<x:A xmlns:x="urn:oasis:names:tc:SAML:2.0:assertion"/>)"}) {
    const Fragment fragment(content);
    EXPECT_EQ(&ExpectElement(&fragment.Element(), "A", kSaml), &fragment.Element());
  }
}

TEST(ExpectElement, RejectsMissingNodeTextAndOtherName) {
  const std::string expected = "Expected element 'A' not found.";
  EXPECT_EQ(ThrownMessage<ParseException>([] { ExpectElement(nullptr, "A", kSaml); }), expected);
  for (const char* content : {"A", "<saml2:B/>", "<saml2:a/>", "<?A?>"}) {
    const Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>(
                  [&] { ExpectElement(fragment.Root().FirstChild(), "A", kSaml); }),
              expected);
  }
}

TEST(ExpectElement, RejectsOtherNamespaceByTheElementsOwnName) {
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

TEST(ExpectEmpty, AcceptsWhiteSpaceAndComments) {
  Fragment fragment("<saml2:A> <!--c-->\n</saml2:A>");
  EXPECT_NO_THROW(ExpectEmpty(fragment.Cursor().Into(fragment.Element())));
}

TEST(ExpectEmpty, RejectsWhatIsLeft) {
  for (const char* content :
       {"<saml2:A><b/></saml2:A>", "<saml2:A>x</saml2:A>", "<saml2:A><?pi?></saml2:A>"}) {
    Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>(
                  [&] { ExpectEmpty(fragment.Cursor().Into(fragment.Element())); }),
              "Element 'saml2:A' must be empty");
  }
}

TEST(ReadTextContent, GivesTheTextAsItIs) {
  EXPECT_EQ(ReadTextContent(Fragment("<a>text</a>").Element()), "text");
  EXPECT_EQ(ReadTextContent(Fragment("<a> \n</a>").Element()), " \n");
  EXPECT_EQ(ReadTextContent(Fragment("<a>a<![CDATA[<b]]>&amp;c</a>").Element()), "a<b&c");
}

TEST(ReadTextContent, RejectsAnythingButOneText) {
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

}  // namespace
}  // namespace SsoClient
