#include "token/name_id_reader.h"

#include <ssoclient/exceptions.h>

#include "support/parsed_xml.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using TestSupport::Fragment;
using TestSupport::ThrownMessage;

TEST(ReadNameId, KeepsFormatAndText) {
  Fragment fragment(R"(<saml2:Issuer Format="urn:f">the issuer</saml2:Issuer><next/>)");
  const NameId nameId = ReadNameId(fragment.Cursor(), "Issuer");
  EXPECT_EQ(nameId.format, "urn:f");
  EXPECT_EQ(nameId.value, "the issuer");
  EXPECT_TRUE(fragment.Cursor().IsAtElement("next"));
}

TEST(ReadNameId, LeavesAnAbsentFormatEmpty) {
  Fragment fragment("<saml2:Issuer>i</saml2:Issuer>");
  EXPECT_EQ(ReadNameId(fragment.Cursor(), "Issuer").format, "");
}

TEST(ReadNameId, RefusesByTheReadingRules) {
  const std::pair<const char*, const char*> cases[] = {
      {"", "Expected element 'Issuer' not found."},
      {"<saml2:NameID>i</saml2:NameID>", "Expected element 'Issuer' not found."},
      {"<ds:Issuer>i</ds:Issuer>", "Element 'ds:Issuer' has unexpected namespace"},
      {R"(<saml2:Issuer NameQualifier="q">i</saml2:Issuer>)",
       "Unexpected attributes on element 'saml2:Issuer'"},
      {R"(<saml2:Issuer NameQualifier="q"/>)", "Unexpected attributes on element 'saml2:Issuer'"},
      {"<saml2:Issuer/>",
       "Element 'saml2:Issuer' must only have textual content (but has extra children or is "
       "empty)."},
      {"<saml2:Issuer>i<!---->j</saml2:Issuer>",
       "Element 'saml2:Issuer' must only have textual content (but has extra children or is "
       "empty)."}};
  for (const auto& [content, message] : cases) {
    Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadNameId(fragment.Cursor(), "Issuer"); }),
              message);
  }
}

TEST(ReadPrincipal, ReadsAUserPrincipalName) {
  Fragment fragment(
      R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">a@b</saml2:NameID>)");
  const PrincipalId principal = ReadPrincipal(fragment.Cursor());
  EXPECT_EQ(principal.name, "a");
  EXPECT_EQ(principal.domain, "b");
}

TEST(ReadPrincipal, RefusesOtherAndMissingFormat) {
  Fragment other(R"(<saml2:NameID Format="urn:f">a@b</saml2:NameID>)");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadPrincipal(other.Cursor()); }),
            "Invalid or unsupported NameId format 'urn:f");
  Fragment missing("<saml2:NameID>a@b</saml2:NameID>");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadPrincipal(missing.Cursor()); }),
            "Invalid or unsupported NameId format '");
  Fragment empty(R"(<saml2:NameID Format="urn:f"/>)");
  EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadPrincipal(empty.Cursor()); }),
            "Element 'saml2:NameID' must only have textual content (but has extra children or is "
            "empty).");
}

// A reader that stops at a comment would see another user than the one that was signed.
TEST(ReadPrincipal, RefusesSplitValues) {
  for (const char* value : {"admin@x<!---->.evil", "admin@x<?p?>.evil", "admin@x<b/>.evil"}) {
    Fragment fragment(
        std::string(R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">)") + value +
        "</saml2:NameID>");
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadPrincipal(fragment.Cursor()); }),
              "Element 'saml2:NameID' must only have textual content (but has extra children or is "
              "empty).");
  }
}

TEST(ReadPrincipal, ReadsCdataAsTheWholeValue) {
  Fragment fragment(
      R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">admin@x<![CDATA[.evil]]>)"
      "</saml2:NameID>");
  EXPECT_EQ(ReadPrincipal(fragment.Cursor()).domain, "x.evil");
}

}  // namespace
}  // namespace SsoClient
