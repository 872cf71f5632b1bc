#include "xml/security/signature_reader.h"

#include <algorithm>
#include <cstddef>
#include <string>
#include <string_view>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/xml/security/signature.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/signed_documents.h"
#include "support/thrown_message.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using testing::HasSubstr;
using testing::StartsWith;

const std::string& Good() {
  static const std::string text = Signed();
  return text;
}

std::string InsertedBefore(std::string_view place, std::string_view what) {
  return Replaced(Good(), place, std::string(what).append(place));
}

TEST(SignatureReaderTest, AcceptsWhatTheOracleSigned) {
  EXPECT_EQ(Verdict(Good()), "valid");
}

struct SyntaxCase {
  const char* name;
  std::string (*make)();
  const char* message;
};

class SignatureSyntaxTest : public testing::TestWithParam<SyntaxCase> {};

TEST_P(SignatureSyntaxTest, IsRefused) {
  EXPECT_EQ(Verdict(GetParam().make()), std::string("syntax: ") + GetParam().message);
}

std::string Inside(std::string_view element, std::string_view content) {
  return Replaced(Good(), std::string("</ds:").append(element),
                  std::string(content).append("</ds:").append(element));
}

std::string Without(std::string_view element) {
  const std::string open = "<ds:" + std::string(element);
  const std::string close = "</ds:" + std::string(element) + ">";
  std::string text = Good();
  const std::size_t start = text.find(open);
  return text.erase(start, text.find(close) + close.size() - start);
}

std::string Twice(std::string_view element) {
  const std::string open = "<ds:" + std::string(element);
  const std::string close = "</ds:" + std::string(element) + ">";
  std::string text = Good();
  const std::size_t start = text.find(open);
  const std::string copy = text.substr(start, text.find(close) + close.size() - start);
  return text.insert(start, copy);
}

// The good document with the whole value in a CDATA section, which does not change its canonical
// form.
std::string InCData(const std::string& localName) {
  const std::string open = "<ds:" + localName + ">";
  const std::string close = "</ds:" + localName + ">";
  const std::string value = Between(Good(), open, close);
  return ReplacedBetween(Good(), open, close, "<![CDATA[" + value + "]]>");
}

const SyntaxCase kCases[] = {
    {"CommentInDigestValue", [] { return Inside("DigestValue", "<!---->"); },
     "Element 'ds:DigestValue' may hold nothing but text."},
    {"CommentInSignatureValue", [] { return Inside("SignatureValue", "<!-- x -->"); },
     "Element 'ds:SignatureValue' may hold nothing but text."},
    {"CommentInCertificate", [] { return Inside("X509Certificate", "<!-- x -->"); },
     "Element 'ds:X509Certificate' may hold nothing but text."},
    {"InstructionInDigestValue", [] { return Inside("DigestValue", "<?x y?>"); },
     "Element 'ds:DigestValue' may hold nothing but text."},
    {"InstructionInSignatureValue", [] { return Inside("SignatureValue", "<?x y?>"); },
     "Element 'ds:SignatureValue' may hold nothing but text."},
    {"ElementInDigestValue", [] { return Inside("DigestValue", "<x/>"); },
     "Element 'ds:DigestValue' may hold nothing but text."},
    {"ElementInSignatureValue", [] { return Inside("SignatureValue", "<x/>"); },
     "Element 'ds:SignatureValue' may hold nothing but text."},
    {"CDataInDigestValue", [] { return InCData("DigestValue"); },
     "Element 'ds:DigestValue' may not hold a CDATA section."},
    {"CDataInSignatureValue", [] { return InCData("SignatureValue"); },
     "Element 'ds:SignatureValue' may not hold a CDATA section."},
    {"CDataInCertificate", [] { return InCData("X509Certificate"); },
     "Element 'ds:X509Certificate' may not hold a CDATA section."},
    {"EmptyCDataInDigestValue", [] { return Inside("DigestValue", "<![CDATA[]]>"); },
     "Element 'ds:DigestValue' may not hold a CDATA section."},
    {"EmptyCDataInSignatureValue", [] { return Inside("SignatureValue", "<![CDATA[]]>"); },
     "Element 'ds:SignatureValue' may not hold a CDATA section."},
    {"InstructionBetweenElements", [] { return InsertedBefore("<ds:SignatureValue>", "<?x y?>"); },
     "Element 'ds:Signature' holds a processing instruction."},
    {"TextBetweenElements", [] { return InsertedBefore("<ds:SignatureValue>", "x"); },
     "Element 'ds:Signature' holds text between its elements."},
    {"SecondSignedInfo", [] { return Twice("SignedInfo"); },
     "Element 'ds:Signature' holds 'ds:SignedInfo' where 'SignatureValue' of XML-Signature is "
     "expected."},
    {"SecondSignatureValue", [] { return Twice("SignatureValue"); },
     "Element 'ds:Signature' holds the unexpected element 'ds:SignatureValue'."},
    {"SecondKeyInfo", [] { return Twice("KeyInfo"); },
     "Element 'ds:Signature' holds the unexpected element 'ds:KeyInfo'."},
    {"SecondDigestValue", [] { return Twice("DigestValue"); },
     "Element 'ds:Reference' holds the unexpected element 'ds:DigestValue'."},
    {"NoSignedInfo", [] { return Without("SignedInfo"); },
     "Element 'ds:Signature' holds 'ds:SignatureValue' where 'SignedInfo' of XML-Signature is "
     "expected."},
    {"NoReference", [] { return Without("Reference"); },
     "Element 'ds:SignedInfo' ends where 'Reference' of XML-Signature is expected."},
    {"NoDigestValue", [] { return Without("DigestValue"); },
     "Element 'ds:Reference' ends where 'DigestValue' of XML-Signature is expected."},
    {"NoSignatureValue", [] { return Without("SignatureValue"); },
     "Element 'ds:Signature' holds 'ds:KeyInfo' where 'SignatureValue' of XML-Signature is "
     "expected."},
    {"SignedInfoInObjectAtTheStart",
     [] {
       const std::string info =
           Between(Good(), "<ds:Signature xmlns:ds=\"http://www.w3.org/2000/09/xmldsig#\">",
                   "<ds:SignatureValue>");
       return InsertedBefore("<ds:SignedInfo>", "<ds:Object>" + info + "</ds:Object>");
     },
     "Element 'ds:Signature' holds 'ds:Object' where 'SignedInfo' of XML-Signature is expected."},
    {"ObjectAtTheEnd",
     [] { return Inside("Signature>", "<ds:Object><ds:SignedInfo/></ds:Object>"); },
     "Element 'ds:Signature' holds the unexpected element 'ds:Object'."},
    {"SignatureMethodInObject",
     [] {
       return InsertedBefore("<ds:SignatureMethod",
                             "<ds:Object><ds:SignatureMethod Algorithm=\"a\"/></ds:Object>");
     },
     "Element 'ds:SignedInfo' holds 'ds:Object' where 'SignatureMethod' of XML-Signature is "
     "expected."},
    {"EmptySignatureValue",
     [] { return ReplacedBetween(Good(), "<ds:SignatureValue>", "</ds:SignatureValue>", " "); },
     "Element 'ds:SignatureValue' is empty."},
    {"EmptyDigestValue",
     [] { return ReplacedBetween(Good(), "<ds:DigestValue>", "</ds:DigestValue>", ""); },
     "Element 'ds:DigestValue' is empty."},
    {"BrokenBase64InDigestValue",
     [] { return ReplacedBetween(Good(), "<ds:DigestValue>", "</ds:DigestValue>", "A-=="); },
     "Element 'ds:DigestValue' does not hold Base64."},
    {"BrokenBase64InSignatureValue", [] { return Inside("SignatureValue", "*"); },
     "Element 'ds:SignatureValue' does not hold Base64."},
    {"NoUri", [] { return Replaced(Good(), " URI=\"#_a1\"", ""); },
     "Element 'ds:Reference' lacks the attribute 'URI'."},
    {"NoAlgorithm",
     [] { return Replaced(Good(), " Algorithm=\"http://www.w3.org/2001/04/xmlenc#sha256\"", ""); },
     "Element 'ds:DigestMethod' lacks the attribute 'Algorithm'."},
    {"UnknownAttribute",
     [] { return Replaced(Good(), "<ds:SignedInfo", "<ds:SignedInfo id=\"x\""); },
     "Element 'ds:SignedInfo' has the unexpected attribute 'id'."},
    {"PrefixedAttribute",
     [] { return Replaced(Good(), "<ds:SignatureValue", "<ds:SignatureValue xml:lang=\"en\""); },
     "Element 'ds:SignatureValue' has the unexpected attribute 'xml:lang'."},
    {"AttributeOfDigestValue",
     [] { return Replaced(Good(), "<ds:DigestValue", "<ds:DigestValue Id=\"x\""); },
     "Element 'ds:DigestValue' has the unexpected attribute 'Id'."},
    {"ElementOfAnotherNamespace",
     [] { return Replaced(Good(), "<ds:SignedInfo>", "<ds:SignedInfo xmlns:ds=\"urn:other\">"); },
     "Element 'ds:Signature' holds 'ds:SignedInfo' where 'SignedInfo' of XML-Signature is "
     "expected."},
    {"SignatureOfAnotherNamespace",
     [] { return Replaced(Good(), "http://www.w3.org/2000/09/xmldsig#\"", "urn:other\""); },
     "Element 'ds:Signature' is not the Signature of XML-Signature."},
    {"EmptyTransforms",
     [] { return ReplacedBetween(Good(), "<ds:Transforms>", "</ds:Transforms>", ""); },
     "Element 'ds:Transforms' ends where 'Transform' of XML-Signature is expected."},
};

INSTANTIATE_TEST_SUITE_P(Cases, SignatureSyntaxTest, testing::ValuesIn(kCases),
                         [](const auto& tested) { return tested.param.name; });

TEST(SignatureReaderTest, AcceptsWhiteSpaceInValuesAndBetweenElements) {
  EXPECT_EQ(Verdict(Inside("SignatureValue", "\n\t ")), "valid");
  EXPECT_EQ(Verdict(Inside("X509Certificate", "\r\n ")), "valid");
  EXPECT_EQ(Verdict(InsertedBefore("<ds:SignatureValue>", "\n  ")), "valid");
  EXPECT_EQ(Verdict(InsertedBefore("<ds:SignatureValue>", "<!-- value follows -->")), "valid");
}

// Above, only CDATA sections in values are rejected.
TEST(SignatureReaderTest, AcceptsCDataSectionsOutsideValues) {
  EXPECT_EQ(Verdict(InsertedBefore("<ds:SignatureValue>", "<![CDATA[ ]]>")), "valid");
  EXPECT_EQ(Verdict(InsertedBefore("<ds:SignatureValue>", "<![CDATA[]]>")), "valid");
}

// White space in SignedInfo is signed: it is allowed, but must not be added later.
TEST(SignatureReaderTest, AcceptsWhiteSpaceInSignedInfoThatIsSigned) {
  const std::string spaced = Inside("DigestValue", "\n\t ");
  EXPECT_EQ(Verdict(spaced), "invalid");
  EXPECT_EQ(Verdict(Resigned(spaced)), "valid");
}

TEST(SignatureReaderTest, AcceptsIdsAndNamespaceDeclarations) {
  EXPECT_EQ(Verdict(Replaced(Good(), "<ds:SignatureValue",
                             "<ds:SignatureValue Id=\"v\" xmlns:x=\"urn:x\"")),
            "valid");
}

TEST(SignatureReaderTest, RefusesUnknownAttributesOfEveryElement) {
  for (const std::string element :
       {"Signature", "SignedInfo", "CanonicalizationMethod", "SignatureMethod", "Reference",
        "Transforms", "Transform", "DigestMethod", "DigestValue", "SignatureValue", "KeyInfo",
        "X509Data", "X509Certificate"}) {
    const std::string open = "<ds:" + element;
    std::string text = Good();
    const std::size_t start = std::min(text.find(open + " "), text.find(open + ">"));
    ASSERT_NE(start, std::string::npos) << element;
    text.insert(start + open.size(), " Other=\"x\"");
    EXPECT_EQ(Verdict(text),
              "syntax: Element 'ds:" + element + "' has the unexpected attribute 'Other'.");
  }
}

TEST(SignatureReaderTest, RefusesAnotherElementOfItsNamespace) {
  const auto document =
      ParseXml("<ds:SignedInfo xmlns:ds=\"http://www.w3.org/2000/09/xmldsig#\"/>");
  EXPECT_EQ(ThrownMessage<SignatureSyntaxException>(
                [&] { CreateSignatureFromDom(document->RootElement()); }, "accepted"),
            "Element 'ds:SignedInfo' is not the Signature of XML-Signature.");
}

std::string WithReferences(std::size_t count) {
  const std::string reference =
      "<ds:Reference" + Between(Good(), "<ds:Reference", "</ds:Reference>") + "</ds:Reference>";
  std::string references;
  references.reserve(reference.size() * count);
  for (std::size_t i = 0; i < count; ++i) {
    references += reference;
  }
  return Replaced(Good(), reference, references);
}

TEST(SignatureReaderTest, LimitsTheNumberOfReferences) {
  EXPECT_EQ(Verdict(Resigned(WithReferences(kMaxReferences))), "valid");
  EXPECT_EQ(Verdict(WithReferences(kMaxReferences + 1)),
            "syntax: A signature may have no more than 16 references.");
  EXPECT_EQ(Verdict(WithReferences(20'000)),
            "syntax: A signature may have no more than 16 references.");
}

TEST(SignatureReaderTest, BoundsWhatItQuotes) {
  const std::string name(5000, 'x');
  const std::string verdict = Verdict(InsertedBefore("<ds:SignedInfo>", "<" + name + "/>"));
  EXPECT_THAT(verdict, StartsWith("syntax: "));
  EXPECT_THAT(verdict, HasSubstr(std::string(120, 'x') + "...'"));
  EXPECT_LT(verdict.size(), 300U);
}

}  // namespace
}  // namespace Tarnik::Testing
