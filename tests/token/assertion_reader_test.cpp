#include "token/assertion_reader.h"

#include <cstddef>
#include <string>
#include <string_view>
#include <tuple>
#include <utility>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/system/date_time.h>

#include "support/assertion_text.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

const Tarnik::System::DateTime kNow = Tarnik::System::DateTime::Parse("2024-03-05T07:01:00Z");

ParsedAssertion Read(const std::string& xml) {
  return ReadAssertion(ParseXml(xml)->RootElement());
}

std::string Refusal(const std::string& xml) {
  return ThrownMessage<ParseException>([&] { Read(xml); });
}

void ExpectAllValues(const ParsedAssertion& parsed) {
  EXPECT_EQ(parsed.version, "2.0");
  EXPECT_EQ(parsed.id, "_a1");
  EXPECT_EQ(parsed.issueInstant.ToString(), "2024-03-05T07:00:00.000Z");
  EXPECT_EQ(parsed.issuer.value, "https://sts.example.com/STS");
  EXPECT_EQ(parsed.issuer.format, "urn:oasis:names:tc:SAML:2.0:nameid-format:entity");
  ASSERT_NE(parsed.signature, nullptr);
  EXPECT_EQ(parsed.signature->References().front().uri, "#_a1");
  EXPECT_EQ(parsed.subject.principal.name, "alice");
  EXPECT_EQ(parsed.conditions.notBefore.ToString(), "2024-03-05T07:00:00.000Z");
  EXPECT_EQ(parsed.conditions.notOnOrAfter.ToString(), "2024-03-05T08:01:00.000Z");
  ASSERT_EQ(parsed.advice.size(), 1U);
  EXPECT_EQ(parsed.advice.front().source, "urn:source");
  ASSERT_TRUE(parsed.authnStatement.has_value());
  EXPECT_EQ(parsed.authnStatement->instant.ToString(), "2024-03-05T07:00:00.000Z");
  EXPECT_EQ(parsed.authnStatement->contextClass,
            "urn:oasis:names:tc:SAML:2.0:ac:classes:PasswordProtectedTransport");
  ASSERT_EQ(parsed.attributes.groups.size(), 2U);
  EXPECT_EQ(parsed.attributes.groups.front().name, "staff");
  EXPECT_EQ(parsed.attributes.names.givenName, "Alice");
  EXPECT_EQ(parsed.attributes.names.surname, "Archer");
}

TEST(ReadAssertionTest, ReadsEveryPart) {
  ExpectAllValues(Read(AssertionText(kNow).ToXml()));
}

TEST(ReadAssertionTest, SkipsBlankLinesTabsAndCommentsBetweenParts) {
  AssertionText text(kNow);
  for (std::string* part : {&text.issuer, &text.signature, &text.subject, &text.conditions,
                            &text.advice, &text.authnStatement, &text.attributeStatement}) {
    part->insert(0, "\n\n\t <!-- comment -->&#13;\n");
  }
  text.tail = "\n<!---->\n";
  ExpectAllValues(Read(text.ToXml()));
}

TEST(ReadAssertionTest, ReadsAnyPrefixAndTheDefaultNamespace) {
  std::string xml = AssertionText(kNow).ToXml();
  const auto replaceAll = [&](std::string_view from, std::string_view to) {
    for (std::size_t at = 0; (at = xml.find(from, at)) != std::string::npos; at += to.size()) {
      xml.replace(at, from.size(), to);
    }
  };
  replaceAll("<saml2:", "<");
  replaceAll("</saml2:", "</");
  replaceAll("xmlns:saml2=", "xmlns=");
  ExpectAllValues(Read(xml));
}

TEST(ReadAssertionTest, AcceptsMissingAdviceAndStatements) {
  for (int present = 0; present < 8; ++present) {
    AssertionText text(kNow);
    if ((present & 1) == 0) {
      text.advice.clear();
    }
    if ((present & 2) == 0) {
      text.authnStatement.clear();
    }
    if ((present & 4) == 0) {
      text.attributeStatement.clear();
    }
    const ParsedAssertion parsed = Read(text.ToXml());
    EXPECT_EQ(parsed.advice.empty(), (present & 1) == 0);
    EXPECT_EQ(parsed.authnStatement.has_value(), (present & 2) != 0);
    EXPECT_EQ(parsed.attributes.groups.empty(), (present & 4) == 0);
  }
}

TEST(ReadAssertionTest, RefusesANonBlankCharacterBetweenParts) {
  const std::pair<std::string AssertionText::*, const char*> cases[] = {
      {&AssertionText::issuer, "Expected element 'Issuer' not found."},
      {&AssertionText::signature, "Expected element ds:Signature not found"},
      {&AssertionText::subject, "Expected element 'Subject' not found."},
      {&AssertionText::conditions, "Expected element 'Conditions' not found."},
      {&AssertionText::advice, "Unexpected elements under Assertion"},
      {&AssertionText::authnStatement, "Unexpected elements under Assertion"},
      {&AssertionText::attributeStatement, "Unexpected elements under Assertion"},
      {&AssertionText::tail, "Unexpected elements under Assertion"}};
  for (const auto& [part, message] : cases) {
    for (const char* intruder : {".", "\xC2\xA0", "<?pi?>"}) {
      AssertionText text(kNow);
      (text.*part).insert(0, intruder);
      EXPECT_EQ(Refusal(text.ToXml()), message);
    }
  }
}

TEST(ReadAssertionTest, RefusesMissingRequiredParts) {
  const std::pair<std::string AssertionText::*, const char*> cases[] = {
      {&AssertionText::issuer, "Expected element 'Issuer' not found."},
      {&AssertionText::subject, "Expected element 'Subject' not found."},
      {&AssertionText::conditions, "Expected element 'Conditions' not found."}};
  for (const auto& [part, message] : cases) {
    AssertionText text(kNow);
    (text.*part).clear();
    EXPECT_EQ(Refusal(text.ToXml()), message);
  }
  EXPECT_EQ(
      Refusal("<saml2:Assertion " + NamespaceDeclarations() + " " + AssertionText(kNow).attributes +
              ">" + AssertionText(kNow).issuer + "</saml2:Assertion>"),
      "Expected element ds:Signature not found");
}

TEST(ReadAssertionTest, RefusesElementsAfterTheLastStatement) {
  for (const char* tail : {"<saml2:AttributeStatement/>", "<saml2:AuthzDecisionStatement/>", "<x/>",
                           "<saml2:Issuer>i</saml2:Issuer>"}) {
    AssertionText text(kNow);
    text.tail = tail;
    EXPECT_EQ(Refusal(text.ToXml()), "Unexpected elements under Assertion");
  }
  AssertionText second(kNow);
  second.tail = second.signature;
  EXPECT_EQ(Refusal(second.ToXml()), "Unexpected elements under Assertion");
}

TEST(ReadAssertionTest, RefusesPartsInAnotherOrder) {
  AssertionText statements(kNow);
  std::swap(statements.authnStatement, statements.attributeStatement);
  EXPECT_EQ(Refusal(statements.ToXml()), "Unexpected elements under Assertion");
  AssertionText advice(kNow);
  std::swap(advice.advice, advice.authnStatement);
  EXPECT_EQ(Refusal(advice.ToXml()), "Unexpected elements under Assertion");
  AssertionText subject(kNow);
  std::swap(subject.subject, subject.conditions);
  EXPECT_EQ(Refusal(subject.ToXml()), "Expected element 'Subject' not found.");
  AssertionText signature(kNow);
  std::swap(signature.issuer, signature.signature);
  EXPECT_EQ(Refusal(signature.ToXml()), "Expected element 'Issuer' not found.");
}

TEST(ReadAssertionTest, RefusesStatementsOfAnotherNamespaceAndNamesThem) {
  for (const char* name : {"Advice", "AuthnStatement", "AttributeStatement"}) {
    AssertionText text(kNow);
    text.advice.clear();
    text.authnStatement.clear();
    text.attributeStatement = std::string("<x:") + name + " xmlns:x=\"urn:x\"/>";
    EXPECT_EQ(Refusal(text.ToXml()),
              std::string("Element 'x:") + name + "' has unexpected namespace");
  }
}

TEST(ReadAssertionTest, RefusesAnotherRoot) {
  EXPECT_EQ(Refusal("<Response/>"), "Expected element 'Assertion' not found.");
  EXPECT_EQ(Refusal("<Assertion/>"), "Element 'Assertion' has unexpected namespace");
  EXPECT_EQ(Refusal(R"(<s:Assertion xmlns:s="urn:oasis:names:tc:SAML:1.0:assertion"/>)"),
            "Element 's:Assertion' has unexpected namespace");
  EXPECT_EQ(ThrownMessage<ParseException>([] { ReadAssertion(nullptr); }),
            "Expected element 'Assertion' not found.");
}

TEST(ReadAssertionTest, AcceptsAdditionalNamespaceDeclarations) {
  AssertionText text(kNow);
  text.attributes += R"( xmlns="urn:default" xmlns:other="urn:other")";
  ExpectAllValues(Read(text.ToXml()));
}

TEST(ReadAssertionTest, RefusesAdditionalAttributes) {
  for (const char* attribute : {" x=\"\"", " xml:lang=\"en\"", " xml:id=\"_a1\"", " Id=\"_a1\"",
                                " xsi:type=\"saml2:AssertionType\"", " saml2:ID=\"_a1\""}) {
    AssertionText text(kNow);
    text.attributes += attribute;
    EXPECT_EQ(Refusal(text.ToXml()), "Unexpected attributes on element 'saml2:Assertion'");
  }
}

TEST(ReadAssertionTest, RefusesMissingOrBrokenAttributes) {
  const std::tuple<const char*, const char*, const char*> cases[] = {
      {" Version=\"2.0\"", "", "Node 'saml2:Assertion is missing required attribute 'Version'"},
      {"ID=\"_a1\" ", "", "Node 'saml2:Assertion is missing required attribute 'ID'"},
      {"ID=\"_a1\" ", "id=\"_a1\" ", "Node 'saml2:Assertion is missing required attribute 'ID'"},
      {" IssueInstant=\"2024-03-05T07:00:00.000Z\"", "",
       "Node 'saml2:Assertion is missing required attribute 'IssueInstant'"},
      {"2024-03-05T07:00:00.000Z", "yesterday", "saml2:Assertion/@IssueInstant is not a date"}};
  for (const auto& [from, to, message] : cases) {
    AssertionText text(kNow);
    text.attributes = Replaced(text.attributes, from, to);
    EXPECT_EQ(Refusal(text.ToXml()), message);
  }
}

TEST(ReadAssertionTest, ReportsAMissingAttributeBeforeAnUnexpectedOne) {
  const std::pair<const char*, const char*> cases[] = {
      {R"(x="" ID="_a1" IssueInstant="soon")",
       "Node 'saml2:Assertion is missing required attribute 'Version'"},
      {R"(x="" IssueInstant="soon" Version="2.0")",
       "Node 'saml2:Assertion is missing required attribute 'ID'"},
      {R"(x="" ID="_a1" Version="2.0")",
       "Node 'saml2:Assertion is missing required attribute 'IssueInstant'"},
      {R"(x="" ID="_a1" IssueInstant="soon" Version="2.0")",
       "Unexpected attributes on element 'saml2:Assertion'"}};
  for (const auto& [attributes, message] : cases) {
    AssertionText text(kNow);
    text.attributes = attributes;
    EXPECT_EQ(Refusal(text.ToXml()), message);
  }
}

TEST(ReadAssertionTest, ReportsTheFirstFaultInReadingOrder) {
  AssertionText text(kNow);
  text.subject = "<x/>";
  text.conditions = "<y/>";
  EXPECT_EQ(Refusal(text.ToXml()), "Expected element 'Subject' not found.");
  text.signature = MadeUpSignature("#other");
  EXPECT_EQ(Refusal(text.ToXml()), "Token's signature must cover the entire token");
  text.attributes = "Version=\"2.0\"";
  EXPECT_EQ(Refusal(text.ToXml()), "Node 'saml2:Assertion is missing required attribute 'ID'");
  text.attributes = "x=\"\"";
  EXPECT_EQ(Refusal(text.ToXml()), "Node 'saml2:Assertion is missing required attribute 'Version'");
}

struct Fault {
  std::string AssertionText::*part;
  const char* broken;
  const char* message;
};

// Every part is broken. Each message appears after the parts before it are fixed.
TEST(ReadAssertionTest, ReadsItsPartsInTheirOrder) {
  const Fault faults[] = {
      {&AssertionText::attributes, R"(ID="_a1" Version="2.0" IssueInstant="soon")",
       "saml2:Assertion/@IssueInstant is not a date"},
      {&AssertionText::issuer, "<saml2:Issuer x=\"\">i</saml2:Issuer>",
       "Unexpected attributes on element 'saml2:Issuer'"},
      {&AssertionText::signature, "text", "Expected element ds:Signature not found"},
      {&AssertionText::subject, "<saml2:Subject/>", "Expected element 'NameID' not found."},
      {&AssertionText::conditions, "<saml2:Conditions/>",
       "Node 'saml2:Conditions is missing required attribute 'NotBefore'"},
      {&AssertionText::advice, "<saml2:Advice x=\"\"/>",
       "Unexpected attributes on element 'saml2:Advice'"},
      {&AssertionText::authnStatement, "<saml2:AuthnStatement/>",
       "Node 'saml2:AuthnStatement is missing required attribute 'AuthnInstant'"},
      {&AssertionText::attributeStatement, "<saml2:AttributeStatement x=\"\"/>",
       "Unexpected attributes on element 'saml2:AttributeStatement'"},
      {&AssertionText::tail, "<x/>", "Unexpected elements under Assertion"}};
  const AssertionText good(kNow);
  AssertionText text(kNow);
  for (const Fault& fault : faults) {
    text.*fault.part = fault.broken;
  }
  for (const Fault& fault : faults) {
    EXPECT_EQ(Refusal(text.ToXml()), fault.message);
    text.*fault.part = good.*fault.part;
  }
  ExpectAllValues(Read(text.ToXml()));
}

}  // namespace
}  // namespace SsoClient::Testing
