#include "token/name_id_reader.h"

#include <string>
#include <utility>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/principal_id.h>

#include "support/fragment.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

TEST(ReadNameIdTest, KeepsFormatAndText) {
  Fragment fragment(R"(<saml2:Issuer Format="urn:f">the issuer</saml2:Issuer><next/>)");
  const NameId nameId = ReadNameId(fragment.Cursor(), "Issuer");
  EXPECT_EQ(nameId.format, "urn:f");
  EXPECT_EQ(nameId.value, "the issuer");
  EXPECT_TRUE(fragment.Cursor().IsAtElement("next"));
}

TEST(ReadNameIdTest, LeavesAnAbsentFormatEmpty) {
  Fragment fragment("<saml2:Issuer>i</saml2:Issuer>");
  EXPECT_EQ(ReadNameId(fragment.Cursor(), "Issuer").format, "");
}

TEST(ReadNameIdTest, KeepsBlanks) {
  Fragment fragment(R"(<saml2:Issuer Format=" urn:f ">
 the issuer	</saml2:Issuer>)");
  const NameId nameId = ReadNameId(fragment.Cursor(), "Issuer");
  EXPECT_EQ(nameId.format, " urn:f ");
  EXPECT_EQ(nameId.value, "\n the issuer\t");
}

TEST(ReadNameIdTest, EnforcesTheReadingRules) {
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

TEST(ReadPrincipalTest, ReadsAUserPrincipalName) {
  Fragment fragment(
      R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">a@b</saml2:NameID>)");
  const PrincipalId principal = ReadPrincipal(fragment.Cursor());
  EXPECT_EQ(principal.name, "a");
  EXPECT_EQ(principal.domain, "b");
}

TEST(ReadPrincipalTest, KeepsBlanks) {
  Fragment fragment(
      "<saml2:NameID Format=\"http://schemas.xmlsoap.org/claims/UPN\">\n a b @ c "
      "\t </saml2:NameID>");
  const PrincipalId principal = ReadPrincipal(fragment.Cursor());
  EXPECT_EQ(principal.name, "\n a b ");
  EXPECT_EQ(principal.domain, " c \t ");
}

TEST(ReadPrincipalTest, ReportsTheFirstOfTwoFaults) {
  const std::pair<const char*, const char*> cases[] = {
      {R"(<ds:NameID x=""/>)", "Element 'ds:NameID' has unexpected namespace"},
      {R"(<saml2:NameID Format="urn:f" x=""/>)", "Unexpected attributes on element 'saml2:NameID'"},
      {R"(<saml2:NameID Format="urn:f">a<!---->b</saml2:NameID>)",
       "Element 'saml2:NameID' must only have textual content (but has extra children or is "
       "empty)."},
      {R"(<saml2:NameID Format="urn:f">ab</saml2:NameID>)",
       "Invalid or unsupported NameId format 'urn:f"}};
  for (const auto& [content, message] : cases) {
    Fragment fragment(content);
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadPrincipal(fragment.Cursor()); }), message)
        << content;
  }
}

TEST(ReadPrincipalTest, RefusesOtherAndMissingFormat) {
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

// A reader that stops at a comment would read another user than the signed one.
TEST(ReadPrincipalTest, RefusesSplitValues) {
  for (const char* value : {"admin@x<!---->.evil", "admin@x<?p?>.evil", "admin@x<b/>.evil"}) {
    Fragment fragment(
        std::string(R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">)") + value +
        "</saml2:NameID>");
    EXPECT_EQ(ThrownMessage<ParseException>([&] { ReadPrincipal(fragment.Cursor()); }),
              "Element 'saml2:NameID' must only have textual content (but has extra children or is "
              "empty).");
  }
}

TEST(ReadPrincipalTest, ReadsCdataAsTheWholeValue) {
  Fragment fragment(
      R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">admin@x<![CDATA[.evil]]>)"
      "</saml2:NameID>");
  EXPECT_EQ(ReadPrincipal(fragment.Cursor()).domain, "x.evil");
}

constexpr char kUpn[] = "http://schemas.xmlsoap.org/claims/UPN";

TEST(PrincipalFromNameIdTest, SplitsAtTheLastAtSign) {
  const PrincipalId plain = PrincipalFromNameId(kUpn, "alice@example.com");
  EXPECT_EQ(plain.name, "alice");
  EXPECT_EQ(plain.domain, "example.com");
  const PrincipalId twice = PrincipalFromNameId(kUpn, "alice@home@example.com");
  EXPECT_EQ(twice.name, "alice@home");
  EXPECT_EQ(twice.domain, "example.com");
}

TEST(PrincipalFromNameIdTest, RejectsMissingPart) {
  for (const std::string value : {"alice", "@example.com", "alice@", "@", "", "a@b@"}) {
    EXPECT_EQ(ThrownMessage<ParseException>([&] { PrincipalFromNameId(kUpn, value); }),
              "Failed to parse the UPN NameID: `" + value + "'; name or domain part is missing.");
  }
}

TEST(PrincipalFromNameIdTest, RejectsOtherFormat) {
  EXPECT_EQ(ThrownMessage<ParseException>([] { PrincipalFromNameId("urn:other", "a@b"); }),
            "Invalid or unsupported NameId format 'urn:other");
  EXPECT_EQ(ThrownMessage<ParseException>([] { PrincipalFromNameId("", "a@b"); }),
            "Invalid or unsupported NameId format '");
  for (const std::string format :
       {"http://schemas.xmlsoap.org/claims/upn", "http://schemas.xmlsoap.org/claims/UPN ",
        "http://schemas.xmlsoap.org/claims/UPN2", "http://schemas.xmlsoap.org/claims/UP"}) {
    EXPECT_EQ(ThrownMessage<ParseException>([&] { PrincipalFromNameId(format, "a@b"); }),
              "Invalid or unsupported NameId format '" + format);
  }
}

TEST(PrincipalFromNameIdTest, ChecksTheFormatBeforeTheValue) {
  EXPECT_EQ(ThrownMessage<ParseException>([] { PrincipalFromNameId("urn:other", "alice"); }),
            "Invalid or unsupported NameId format 'urn:other");
}

TEST(PrincipalFromGroupIdentityTest, SplitsAtTheFirstBackslash) {
  const PrincipalId plain = PrincipalFromGroupIdentity("EXAMPLE\\staff");
  EXPECT_EQ(plain.name, "staff");
  EXPECT_EQ(plain.domain, "EXAMPLE");
  const PrincipalId twice = PrincipalFromGroupIdentity("EXAMPLE\\staff\\night");
  EXPECT_EQ(twice.name, "staff\\night");
  EXPECT_EQ(twice.domain, "EXAMPLE");
}

TEST(PrincipalFromGroupIdentityTest, RejectsMissingPart) {
  for (const std::string value : {"staff", "\\staff", "EXAMPLE\\", "\\", "", "EXAMPLE/staff"}) {
    EXPECT_EQ(ThrownMessage<ParseException>([&] { PrincipalFromGroupIdentity(value); }),
              "Failed to parse Group Identity value: `" + value + "'; domain or group missing");
  }
}

}  // namespace
}  // namespace SsoClient::Testing
