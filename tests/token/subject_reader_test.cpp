#include "token/subject_reader.h"

#include <cstddef>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <tarnik/core/exception.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/system/date_time.h>

#include "support/assertion_text.h"
#include "support/fragment.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

const Tarnik::System::DateTime kNow = Tarnik::System::DateTime::Parse("2024-03-05T07:00:00Z");

std::string BearerText() {
  return AssertionText(kNow).subject;
}

std::string HolderOfKeyText() {
  return AssertionText(kNow).ConfirmByKey(TrustedCredential().certificatePem).subject;
}

ParsedSubject Read(const std::string& text) {
  Fragment fragment(text);
  ParsedSubject subject = ReadSubject(fragment.Cursor());
  EXPECT_TRUE(fragment.Cursor().IsAtEnd());
  return subject;
}

std::string Refusal(const std::string& text) {
  return ThrownMessage<ParseException>([&] { Read(text); });
}

TEST(ReadSubjectTest, ReadsABearerSubject) {
  const ParsedSubject subject = Read(BearerText());
  EXPECT_EQ(subject.principal.name, "alice");
  EXPECT_EQ(subject.principal.domain, "example.com");
  EXPECT_EQ(subject.confirmationMethod, BEARER);
  EXPECT_FALSE(subject.delegateId.has_value());
  EXPECT_EQ(subject.notOnOrAfter.ToString(), "2024-03-05T08:00:00.000Z");
  EXPECT_EQ(subject.holderOfKeyCertificate, nullptr);
}

std::string DerOf(const Tarnik::Crypto::Certificate& certificate) {
  return std::string(reinterpret_cast<const char*>(certificate.DerBytes()),
                     certificate.DerLength());
}

TEST(ReadSubjectTest, ReadsAHolderOfKeySubject) {
  const ParsedSubject subject = Read(HolderOfKeyText());
  EXPECT_EQ(subject.confirmationMethod, HOLDER_OF_KEY);
  EXPECT_EQ(subject.notOnOrAfter.ToString(), "2024-03-05T08:00:00.000Z");
  ASSERT_NE(subject.holderOfKeyCertificate, nullptr);
  const auto expected =
      Tarnik::Crypto::CreateCertificatesFromPem(TrustedCredential().certificatePem).front();
  EXPECT_EQ(DerOf(*subject.holderOfKeyCertificate), DerOf(*expected));
  EXPECT_FALSE(subject.delegateId.has_value());
}

TEST(ReadSubjectTest, ReadsTheDelegateId) {
  const ParsedSubject subject = Read(AssertionText(kNow).Delegate().subject);
  ASSERT_TRUE(subject.delegateId.has_value());
  EXPECT_EQ(subject.delegateId->name, "second");
  EXPECT_EQ(subject.delegateId->domain, "example.com");
  EXPECT_EQ(subject.principal.name, "alice");
}

TEST(ReadSubjectTest, ReadsTheDelegateIdAsAPrincipal) {
  const std::string text = AssertionText(kNow).Delegate().subject;
  EXPECT_EQ(Refusal(Replaced(text, "second@example.com", "second")),
            "Failed to parse the UPN NameID: `second'; name or domain part is missing.");
  EXPECT_EQ(Refusal(Replaced(text, R"(cm:bearer"><saml2:NameID Format="http://)",
                             R"(cm:bearer"><saml2:NameID Format="https://)")),
            "Invalid or unsupported NameId format 'https://schemas.xmlsoap.org/claims/UPN");
}

TEST(ReadSubjectTest, SkipsWhiteSpaceAndComments) {
  std::string text = HolderOfKeyText();
  for (const char* tag : {"<saml2:NameID ", "<saml2:SubjectConfirmation ", "<ds:KeyInfo>",
                          "<ds:X509Data>", "<ds:X509Certificate>", "</ds:X509Data>"}) {
    text = Replaced(text, tag, std::string("\n <!--c-->\t").append(tag));
  }
  EXPECT_EQ(Read(text).principal.name, "alice");
}

TEST(ReadSubjectTest, ReadsTheTypeByItsExpandedName) {
  const std::string type = R"(xsi:type="saml2:KeyInfoConfirmationDataType")";
  EXPECT_EQ(Read(Replaced(HolderOfKeyText(), type,
                          R"(xsi:type="KeyInfoConfirmationDataType" )"
                          R"(xmlns="urn:oasis:names:tc:SAML:2.0:assertion")"))
                .confirmationMethod,
            HOLDER_OF_KEY);
  EXPECT_EQ(Read(Replaced(HolderOfKeyText(), type,
                          R"(i:type="s:KeyInfoConfirmationDataType" )"
                          R"(xmlns:s="urn:oasis:names:tc:SAML:2.0:assertion" )"
                          R"(xmlns:i="http://www.w3.org/2001/XMLSchema-instance")"))
                .confirmationMethod,
            HOLDER_OF_KEY);
}

// XML Schema Part 2, section 4.3.6: white space around a QName is not part of it.
TEST(ReadSubjectTest, ReadsTheTypeWithoutTheWhiteSpaceAroundIt) {
  for (const std::string type :
       {" saml2:KeyInfoConfirmationDataType", "saml2:KeyInfoConfirmationDataType ",
        "&#10;&#9; saml2:KeyInfoConfirmationDataType&#13;"}) {
    EXPECT_EQ(Read(Replaced(HolderOfKeyText(), "saml2:KeyInfoConfirmationDataType", type))
                  .confirmationMethod,
              HOLDER_OF_KEY)
        << type;
  }
}

TEST(ReadSubjectTest, RefusesOtherTypesOfHolderOfKeyData) {
  for (const std::string type :
       {"saml2:SubjectConfirmationDataType", "ds:KeyInfoConfirmationDataType",
        "KeyInfoConfirmationDataType", "", " ", "saml2:KeyInfoConfirmationDataType x"}) {
    EXPECT_EQ(Refusal(Replaced(HolderOfKeyText(), "saml2:KeyInfoConfirmationDataType", type)),
              "Invalid SubjectConfirmationData type: '" + type + "'");
  }
  EXPECT_EQ(
      Refusal(Replaced(HolderOfKeyText(), R"(xsi:type="saml2:KeyInfoConfirmationDataType")", "")),
      "Node 'saml2:SubjectConfirmationData is missing required attribute 'xsi:type'");
  EXPECT_EQ(Refusal(Replaced(HolderOfKeyText(), "\"saml2:Key", "\"unbound:Key")),
            "Element saml2:SubjectConfirmationDataat 1," +
                std::to_string(("<root " + NamespaceDeclarations() + ">" + HolderOfKeyText())
                                   .find("<saml2:SubjectConfirmationData") +
                               1) +
                " uses undefined prefix: `unbound'");
}

TEST(ReadSubjectTest, RefusesUnknownMethods) {
  for (const std::string method :
       {"urn:oasis:names:tc:SAML:2.0:cm:sender-vouches", "",
        "urn:oasis:names:tc:SAML:2.0:cm:BEARER", "urn:oasis:names:tc:SAML:2.0:cm:bearer "}) {
    EXPECT_EQ(Refusal(Replaced(BearerText(), "urn:oasis:names:tc:SAML:2.0:cm:bearer", method)),
              "Unknown subject confirmation method: '" + method + "'");
  }
}

// Positions after an expected child, the innermost first.
constexpr std::pair<const char*, const char*> kEnds[] = {
    {"</ds:X509Certificate>", "Unexpected elements after X509Certificate"},
    {"</ds:X509Data>", "Unexpected elements after X509Data"},
    {"</ds:KeyInfo>", "Unexpected elements after SubjectConfirmationData/KeyInfo"},
    {"</saml2:SubjectConfirmationData>", "Unexpected elements after SubjectConfirmationData"},
    {"</saml2:SubjectConfirmation>", "Unexpected elements after SubjectConfirmation"}};

TEST(ReadSubjectTest, RefusesAnythingAfterAnExpectedChild) {
  for (const auto& [anchor, message] : kEnds) {
    for (const char* addition : {"<x/>", "text", "<?pi?>"}) {
      EXPECT_EQ(Refusal(InsertedAfter(HolderOfKeyText(), anchor, addition)), message);
    }
  }
}

// There is an unexpected element after every child. Each message appears after the inner ones are
// fixed.
TEST(ReadSubjectTest, ReportsTheInnermostFaultFirst) {
  std::string text = HolderOfKeyText();
  for (const auto& [anchor, message] : kEnds) {
    text = InsertedAfter(text, anchor, "<x/>");
  }
  for (const auto& [anchor, message] : kEnds) {
    EXPECT_EQ(Refusal(text), message);
    text = Replaced(text, std::string(anchor) + "<x/>", anchor);
  }
  EXPECT_EQ(Read(text).principal.name, "alice");
}

TEST(ReadSubjectTest, ChecksTheMethodBeforeTheConfirmationData) {
  const std::string text = Replaced(BearerText(), "cm:bearer", "cm:other");
  EXPECT_EQ(Refusal(Replaced(text, "<saml2:SubjectConfirmationData ", "<x ")),
            "Unknown subject confirmation method: 'urn:oasis:names:tc:SAML:2.0:cm:other'");
  EXPECT_EQ(Refusal(Replaced(text, "<saml2:SubjectConfirmationData ",
                             "<saml2:NameID/><saml2:SubjectConfirmationData ")),
            "Unknown subject confirmation method: 'urn:oasis:names:tc:SAML:2.0:cm:other'");
  EXPECT_EQ(Refusal(Replaced(text, "alice@example.com", "alice")),
            "Failed to parse the UPN NameID: `alice'; name or domain part is missing.");
}

TEST(ReadSubjectTest, RefusesASecondCertificateOrConfirmation) {
  EXPECT_EQ(Refusal(InsertedAfter(HolderOfKeyText(), "</ds:X509Certificate>",
                                  "<ds:X509Certificate>AA==</ds:X509Certificate>")),
            "Unexpected elements after X509Certificate");
  const std::string confirmation = BearerText().substr(
      BearerText().find("<saml2:SubjectConfirmation "),
      BearerText().find("</saml2:Subject>") - BearerText().find("<saml2:SubjectConfirmation "));
  EXPECT_EQ(Refusal(InsertedAfter(BearerText(), "</saml2:SubjectConfirmation>", confirmation)),
            "Unexpected elements after SubjectConfirmation");
}

TEST(ReadSubjectTest, RefusesMissingParts) {
  EXPECT_EQ(Refusal("<saml2:Subject/>"), "Expected element 'NameID' not found.");
  EXPECT_EQ(Refusal(Replaced(BearerText(), "</saml2:NameID>", "</saml2:NameID><x/>")),
            "Expected element 'SubjectConfirmation' not found.");
  EXPECT_EQ(
      Refusal(Replaced(BearerText(), R"( Method="urn:oasis:names:tc:SAML:2.0:cm:bearer")", "")),
      "Node 'saml2:SubjectConfirmation is missing required attribute 'Method'");
  for (const std::string& text : {BearerText(), HolderOfKeyText()}) {
    EXPECT_EQ(Refusal(Replaced(text, " NotOnOrAfter=\"2024-03-05T08:00:00.000Z\"", "")),
              "Node 'saml2:SubjectConfirmationData is missing required attribute 'NotOnOrAfter'");
    EXPECT_EQ(Refusal(Replaced(text, "2024-03-05T08:00:00.000Z", "later")),
              "saml2:SubjectConfirmationData/@NotOnOrAfter is not a date");
  }
  EXPECT_EQ(Refusal(Replaced(BearerText(),
                             "<saml2:SubjectConfirmationData "
                             "NotOnOrAfter=\"2024-03-05T08:00:00.000Z\"/>",
                             "")),
            "Expected element 'SubjectConfirmationData' not found.");
}

constexpr char kNameId[] =
    R"(<saml2:NameID Format="http://schemas.xmlsoap.org/claims/UPN">a@b</saml2:NameID>)";

TEST(ReadSubjectTest, RefusesASubjectThatEndsAfterItsNameId) {
  EXPECT_EQ(Refusal(std::string("<saml2:Subject>") + kNameId + "</saml2:Subject>"),
            "Expected element 'SubjectConfirmation' not found.");
  EXPECT_EQ(Refusal(std::string("<saml2:Subject>") + kNameId + "\n<!--c--></saml2:Subject>"),
            "Expected element 'SubjectConfirmation' not found.");
}

TEST(ReadSubjectTest, ReportsTheFirstOfTwoFaultsInTheSubject) {
  EXPECT_EQ(Refusal("<saml2:Subject x=\"\"/>"), "Unexpected attributes on element 'saml2:Subject'");
  const std::string bearer =
      R"(<saml2:SubjectConfirmation Method="urn:oasis:names:tc:SAML:2.0:cm:bearer">)";
  const std::string end = "</saml2:SubjectConfirmation>";
  const std::pair<std::string, const char*> cases[] = {
      {"<x/>", "Expected element 'SubjectConfirmation' not found."},
      {"<saml2:SubjectConfirmation x=\"\"/>",
       "Node 'saml2:SubjectConfirmation is missing required attribute 'Method'"},
      {"<saml2:SubjectConfirmation x=\"\" Method=\"m\"/>",
       "Unexpected attributes on element 'saml2:SubjectConfirmation'"},
      {"<saml2:SubjectConfirmation Method=\"m\"/>", "Unknown subject confirmation method: 'm'"},
      {bearer + Replaced(kNameId, "a@b", "ab") + "<saml2:SubjectConfirmationData/>" + end,
       "Failed to parse the UPN NameID: `ab'; name or domain part is missing."},
      {bearer + kNameId + kNameId +
           R"(<saml2:SubjectConfirmationData NotOnOrAfter="2024-03-05T08:00:00Z"/>)" + end,
       "Expected element 'SubjectConfirmationData' not found."},
      {bearer + "<saml2:SubjectConfirmationData/><x/>" + end + "<y/>",
       "Node 'saml2:SubjectConfirmationData is missing required attribute 'NotOnOrAfter'"}};
  for (const auto& [confirmation, message] : cases) {
    EXPECT_EQ(Refusal(std::string("<saml2:Subject>") + kNameId + confirmation + "</saml2:Subject>"),
              message)
        << confirmation;
  }
}

// A subject with this method, whose data has these attributes and this content.
std::string SubjectWithData(const std::string& method, const std::string& data) {
  return std::string("<saml2:Subject>") + kNameId +
         R"(<saml2:SubjectConfirmation Method="urn:oasis:names:tc:SAML:2.0:cm:)" + method +
         "\"><saml2:SubjectConfirmationData " + data +
         "</saml2:SubjectConfirmationData></saml2:SubjectConfirmation></saml2:Subject>";
}

TEST(ReadSubjectTest, ReportsTheFirstOfTwoFaultsInBearerData) {
  const std::pair<const char*, const char*> cases[] = {
      {R"(x="">)",
       "Node 'saml2:SubjectConfirmationData is missing required attribute 'NotOnOrAfter'"},
      {R"(x="" NotOnOrAfter="later">)",
       "Unexpected attribute 'x' on element 'saml2:SubjectConfirmationData'"},
      {R"(NotOnOrAfter="later">)", "saml2:SubjectConfirmationData/@NotOnOrAfter is not a date"}};
  for (const auto& [attributes, message] : cases) {
    EXPECT_EQ(Refusal(SubjectWithData("bearer", std::string(attributes) + "<y/>")), message);
  }
}

TEST(ReadSubjectTest, ReportsTheFirstOfTwoFaultsInHolderOfKeyData) {
  const std::pair<const char*, const char*> cases[] = {
      {R"(x="">)",
       "Node 'saml2:SubjectConfirmationData is missing required attribute 'NotOnOrAfter'"},
      {R"(x="" xsi:type="saml2:T">)",
       "Node 'saml2:SubjectConfirmationData is missing required attribute 'NotOnOrAfter'"},
      {R"(x="" NotOnOrAfter="later">)",
       "Node 'saml2:SubjectConfirmationData is missing required attribute 'xsi:type'"},
      {R"(x="" NotOnOrAfter="later" xsi:type="saml2:T">)",
       "Unexpected attribute 'x' on element 'saml2:SubjectConfirmationData'"},
      {R"(NotOnOrAfter="later" xsi:type="saml2:T">)",
       "Invalid SubjectConfirmationData type: 'saml2:T'"},
      {R"(NotOnOrAfter="later" xsi:type="saml2:KeyInfoConfirmationDataType">)",
       "saml2:SubjectConfirmationData/@NotOnOrAfter is not a date"}};
  for (const auto& [attributes, message] : cases) {
    EXPECT_EQ(Refusal(SubjectWithData("holder-of-key", std::string(attributes) + "<y/>")), message);
  }
}

// A holder-of-key subject whose KeyInfo is replaced.
std::string SubjectWithKeyInfo(const std::string& keyInfo) {
  return SubjectWithData("holder-of-key", R"(NotOnOrAfter="2024-03-05T08:00:00Z" )"
                                          R"(xsi:type="saml2:KeyInfoConfirmationDataType">)" +
                                              keyInfo);
}

TEST(ReadSubjectTest, ReportsTheFirstOfTwoFaultsInKeyInfo) {
  const std::pair<std::string, const char*> cases[] = {
      {"<ds:KeyInfo x=\"\"><y/></ds:KeyInfo>", "Unexpected attributes on element 'ds:KeyInfo'"},
      {"<ds:KeyInfo><y/></ds:KeyInfo><z/>", "Expected element 'X509Data' not found."},
      {"<ds:KeyInfo><ds:X509Data x=\"\"><y/></ds:X509Data></ds:KeyInfo>",
       "Unexpected attributes on element 'ds:X509Data'"},
      {"<ds:KeyInfo><ds:X509Data><y/></ds:X509Data><z/></ds:KeyInfo>",
       "Expected element 'X509Certificate' not found."},
      {"<ds:KeyInfo><ds:X509Data><ds:X509Certificate x=\"\"/></ds:X509Data></ds:KeyInfo>",
       "Unexpected attributes on element 'ds:X509Certificate'"},
      {"<ds:KeyInfo><ds:X509Data><ds:X509Certificate/><y/></ds:X509Data></ds:KeyInfo>",
       "Element 'ds:X509Certificate' must only have textual content (but has extra children or is "
       "empty)."}};
  for (const auto& [keyInfo, message] : cases) {
    EXPECT_EQ(Refusal(SubjectWithKeyInfo(keyInfo)), message) << keyInfo;
  }
}

TEST(ReadSubjectTest, ReadsTheCertificateBeforeWhatFollowsIt) {
  const auto subject = [](const std::string& certificate) {
    return SubjectWithKeyInfo("<ds:KeyInfo><ds:X509Data><ds:X509Certificate>" + certificate +
                              "</ds:X509Certificate><x/></ds:X509Data><y/></ds:KeyInfo><z/>");
  };
  EXPECT_THROW(Read(subject("not base64!")), Tarnik::Base64FormatException);
  EXPECT_THROW(Read(subject("AAECAwQF")), Tarnik::Crypto::CryptoException);
  EXPECT_EQ(Refusal(subject(CertificateBody(TrustedCredential().certificatePem))),
            "Unexpected elements after X509Certificate");
}

TEST(ReadSubjectTest, RefusesMissingKeyMaterial) {
  const std::string certificate = "<ds:X509Certificate>" +
                                  CertificateBody(TrustedCredential().certificatePem) +
                                  "</ds:X509Certificate>";
  const std::string data = "<ds:X509Data>" + certificate + "</ds:X509Data>";
  EXPECT_EQ(Refusal(Replaced(HolderOfKeyText(), certificate, "")),
            "Expected element 'X509Certificate' not found.");
  EXPECT_EQ(Refusal(Replaced(HolderOfKeyText(), data, "")),
            "Expected element 'X509Data' not found.");
  EXPECT_EQ(Refusal(Replaced(HolderOfKeyText(), "<ds:KeyInfo>" + data + "</ds:KeyInfo>", "")),
            "Expected element 'KeyInfo' not found.");
  EXPECT_EQ(Refusal(Replaced(Replaced(HolderOfKeyText(), "<ds:X509Data>", "<saml2:X509Data>"),
                             "</ds:X509Data>", "</saml2:X509Data>")),
            "Element 'saml2:X509Data' has unexpected namespace");
}

TEST(ReadSubjectTest, PassesThePlatformsFaultsOfACertificate) {
  const std::string body = CertificateBody(TrustedCredential().certificatePem);
  EXPECT_THROW(Read(Replaced(HolderOfKeyText(), body, "not base64!")),
               Tarnik::Base64FormatException);
  EXPECT_THROW(Read(Replaced(HolderOfKeyText(), body, "AAECAwQF")),
               Tarnik::Crypto::CryptoException);
}

TEST(ReadSubjectTest, AcceptsBearerDataWithAType) {
  for (const char* type : {"saml2:SubjectConfirmationDataType", "saml2:KeyInfoConfirmationDataType",
                           "Untyped", "unbound:T", ""}) {
    const ParsedSubject subject =
        Read(Replaced(BearerText(), "Z\"/>", std::string("Z\" xsi:type=\"") + type + "\"/>"));
    EXPECT_EQ(subject.confirmationMethod, BEARER) << type;
    EXPECT_EQ(subject.notOnOrAfter.ToString(), "2024-03-05T08:00:00.000Z") << type;
    EXPECT_EQ(subject.holderOfKeyCertificate, nullptr) << type;
  }
}

// A type that requires a key does not allow one in bearer data.
TEST(ReadSubjectTest, RefusesABearerKeyWithAnyType) {
  EXPECT_EQ(Refusal(Replaced(HolderOfKeyText(), "cm:holder-of-key", "cm:bearer")),
            "Element 'saml2:SubjectConfirmationData' must be empty");
}

TEST(ReadSubjectTest, RefusesBearerDataWithAdditionalContent) {
  const std::string end = "Z\"/>";
  EXPECT_EQ(Refusal(Replaced(BearerText(), end, "Z\" Recipient=\"urn:r\"/>")),
            "Unexpected attribute 'Recipient' on element 'saml2:SubjectConfirmationData'");
  EXPECT_EQ(Refusal(Replaced(BearerText(), end, "Z\" type=\"saml2:T\"/>")),
            "Unexpected attribute 'type' on element 'saml2:SubjectConfirmationData'");
  EXPECT_EQ(Refusal(Replaced(BearerText(), end, "Z\" xsi:nil=\"true\"/>")),
            "Unexpected attribute 'xsi:nil' on element 'saml2:SubjectConfirmationData'");
  EXPECT_EQ(
      Refusal(Replaced(BearerText(), end, "Z\"><ds:KeyInfo/></saml2:SubjectConfirmationData>")),
      "Element 'saml2:SubjectConfirmationData' must be empty");
}

TEST(ReadSubjectTest, RefusesUnexpectedAttributes) {
  const std::pair<const char*, const char*> cases[] = {
      {"<saml2:Subject", "saml2:Subject"},
      {"<ds:KeyInfo", "ds:KeyInfo"},
      {"<ds:X509Data", "ds:X509Data"},
      {"<ds:X509Certificate", "ds:X509Certificate"}};
  for (const auto& [tag, name] : cases) {
    const std::string open = std::string(tag) + ">";
    EXPECT_EQ(Refusal(Replaced(HolderOfKeyText(), open, std::string(tag) + " Id=\"i\">")),
              std::string("Unexpected attributes on element '") + name + "'");
  }
  EXPECT_EQ(Refusal(Replaced(BearerText(), " Method=", " Id=\"i\" Method=")),
            "Unexpected attributes on element 'saml2:SubjectConfirmation'");
}

}  // namespace
}  // namespace SsoClient::Testing
