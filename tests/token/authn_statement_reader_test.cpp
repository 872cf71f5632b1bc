#include "token/statement_readers.h"

#include <ssoclient/exceptions.h>

#include "support/assertion_text.h"
#include "support/parsed_xml.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using TestSupport::Fragment;
using TestSupport::InsertedBehind;
using TestSupport::Replaced;
using TestSupport::ThrownMessage;

constexpr char kStatement[] =
    R"(<saml2:AuthnStatement AuthnInstant="2024-03-05T07:08:09Z"> <saml2:AuthnContext>)"
    R"(<saml2:AuthnContextClassRef>urn:class</saml2:AuthnContextClassRef><!--c-->)"
    R"(</saml2:AuthnContext></saml2:AuthnStatement>)";

std::string Refusal(const std::string& text) {
  Fragment fragment(text);
  return ThrownMessage<ParseException>([&] { ReadAuthnStatement(fragment.Cursor()); });
}

TEST(ReadAuthnStatement, ReadsInstantAndClass) {
  Fragment fragment(std::string(kStatement) + "<next/>");
  const AuthnStatement statement = ReadAuthnStatement(fragment.Cursor());
  EXPECT_EQ(statement.instant.ToString(), "2024-03-05T07:08:09.000Z");
  EXPECT_EQ(statement.contextClass, "urn:class");
  EXPECT_TRUE(fragment.Cursor().IsAtElement("next"));
}

TEST(ReadAuthnStatement, RefusesWhatStandsBehindAnExpectedChild) {
  for (const char* addition : {"<x/>", "text", "<?p?>"}) {
    EXPECT_EQ(Refusal(InsertedBehind(kStatement, "</saml2:AuthnContextClassRef>", addition)),
              "Unexpected elements after AuthnContextClassRef");
    EXPECT_EQ(Refusal(InsertedBehind(kStatement, "</saml2:AuthnContext>", addition)),
              "Unexpected elements after AuthnContext");
  }
}

TEST(ReadAuthnStatement, RefusesByTheReadingRules) {
  EXPECT_EQ(Refusal(Replaced(kStatement, R"( AuthnInstant="2024-03-05T07:08:09Z")", "")),
            "Node 'saml2:AuthnStatement is missing required attribute 'AuthnInstant'");
  EXPECT_EQ(Refusal(Replaced(kStatement, "2024-03-05T07:08:09Z", "now")),
            "saml2:AuthnStatement/@AuthnInstant is not a date");
  EXPECT_EQ(Refusal(Replaced(kStatement, " AuthnInstant", " SessionIndex=\"1\" AuthnInstant")),
            "Unexpected attributes on element 'saml2:AuthnStatement'");
  EXPECT_EQ(Refusal(Replaced(kStatement, "<saml2:AuthnContext>", "<saml2:AuthnContext x=\"\">")),
            "Unexpected attributes on element 'saml2:AuthnContext'");
  EXPECT_EQ(Refusal(Replaced(kStatement, "<saml2:AuthnContextClassRef>",
                             "<saml2:AuthnContextClassRef x=\"\">")),
            "Unexpected attributes on element 'saml2:AuthnContextClassRef'");
  EXPECT_EQ(Refusal(Replaced(kStatement, "urn:class", "")),
            "Element 'saml2:AuthnContextClassRef' must only have textual content (but has extra "
            "children or is empty).");
  EXPECT_EQ(Refusal(Replaced(kStatement, "<saml2:AuthnContext>",
                             "<saml2:SubjectLocality/>"
                             "<saml2:AuthnContext>")),
            "Expected element 'AuthnContext' not found.");
  EXPECT_EQ(
      Refusal(Replaced(kStatement,
                       "<saml2:AuthnContextClassRef>urn:class</saml2:AuthnContextClassRef>", "")),
      "Expected element 'AuthnContextClassRef' not found.");
  EXPECT_EQ(Refusal("<ds:AuthnStatement/>"),
            "Element 'ds:AuthnStatement' has unexpected namespace");
}

}  // namespace
}  // namespace SsoClient
