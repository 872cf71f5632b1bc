#include "xml/security/key_info_reader.h"

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/xml/security/xml_security_exception.h>

#include "support/thrown_message.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using testing::ElementsAre;
using testing::IsEmpty;

KeyInfo Read(const std::string& content, const std::string& attributes = "") {
  const auto document = ParseXml("<KeyInfo xmlns=\"http://www.w3.org/2000/09/xmldsig#\"" +
                                 attributes + ">" + content + "</KeyInfo>");
  return ReadKeyInfo(document->RootElement());
}

std::string ReadError(const std::string& content, const std::string& attributes = "") {
  return ThrownMessage<SignatureSyntaxException>([&] { Read(content, attributes); }, "accepted");
}

TEST(KeyInfoReaderTest, ReadsEveryX509Hint) {
  const KeyInfo keyInfo = Read(
      "<KeyName> name </KeyName>"
      "<X509Data><X509IssuerSerial><X509IssuerName>CN=a</X509IssuerName>\n"
      "<X509SerialNumber> 12 </X509SerialNumber></X509IssuerSerial>"
      "<X509SKI>AQI=</X509SKI><X509SubjectName>CN=b</X509SubjectName>"
      "<X509Certificate>AQID\n</X509Certificate><X509CRL>AAAA</X509CRL></X509Data>"
      "<X509Data><X509Certificate>BA==</X509Certificate></X509Data>",
      " Id=\"k\"");
  EXPECT_THAT(keyInfo.keyNames, ElementsAre("name"));
  ASSERT_EQ(keyInfo.issuerSerials.size(), 1U);
  EXPECT_EQ(keyInfo.issuerSerials[0].issuerName, "CN=a");
  EXPECT_EQ(keyInfo.issuerSerials[0].serialNumber, "12");
  EXPECT_THAT(keyInfo.subjectKeyIdentifiers, ElementsAre(ElementsAre(1, 2)));
  EXPECT_THAT(keyInfo.subjectNames, ElementsAre("CN=b"));
  EXPECT_THAT(keyInfo.certificates, ElementsAre(ElementsAre(1, 2, 3), ElementsAre(4)));
  EXPECT_EQ(keyInfo.element->LocalName(), "KeyInfo");
}

TEST(KeyInfoReaderTest, SkipsWhatIsNotAnX509Hint) {
  const KeyInfo keyInfo = Read(
      "<KeyValue><RSAKeyValue><Modulus></Modulus></RSAKeyValue></KeyValue><PGPData/><SPKIData/>"
      "<MgmtData>x</MgmtData><o:Other xmlns:o=\"urn:other\">text</o:Other>"
      "<X509Data><d:X509Digest xmlns:d=\"http://www.w3.org/2009/xmldsig11#\"/></X509Data>");
  EXPECT_THAT(keyInfo.certificates, IsEmpty());
  EXPECT_THAT(keyInfo.issuerSerials, IsEmpty());
  EXPECT_THAT(keyInfo.subjectKeyIdentifiers, IsEmpty());
  EXPECT_THAT(keyInfo.subjectNames, IsEmpty());
  EXPECT_THAT(keyInfo.keyNames, IsEmpty());
}

struct Case {
  const char* name;
  const char* content;
  const char* message;
};

class KeyInfoSyntaxTest : public testing::TestWithParam<Case> {};

TEST_P(KeyInfoSyntaxTest, IsRefused) {
  EXPECT_EQ(ReadError(GetParam().content), GetParam().message);
}

INSTANTIATE_TEST_SUITE_P(
    Cases, KeyInfoSyntaxTest,
    testing::Values(
        Case{"Empty", " ", "Element 'KeyInfo' is empty."},
        Case{"Text", "x<KeyName/>", "Element 'KeyInfo' holds text between its elements."},
        Case{"RetrievalMethod", "<RetrievalMethod URI=\"file:///etc/passwd\"/>",
             "Element 'KeyInfo' may not hold 'RetrievalMethod'."},
        Case{"KeyInfoReference",
             "<d:KeyInfoReference xmlns:d=\"http://www.w3.org/2009/xmldsig11#\" URI=\"#x\"/>",
             "Element 'KeyInfo' may not hold 'd:KeyInfoReference'."},
        Case{"UnknownElement", "<KeyNames/>", "Element 'KeyInfo' may not hold 'KeyNames'."},
        Case{"EmptyX509Data", "<X509Data/>", "Element 'X509Data' is empty."},
        Case{"UnknownElementInX509Data", "<X509Data><X509Cert/></X509Data>",
             "Element 'X509Data' may not hold 'X509Cert'."},
        Case{"EmptyCertificate", "<X509Data><X509Certificate/></X509Data>",
             "Element 'X509Certificate' is empty."},
        Case{"BrokenBase64", "<X509Data><X509Certificate>A</X509Certificate></X509Data>",
             "Element 'X509Certificate' does not hold Base64."},
        Case{"CommentInCertificate",
             "<X509Data><X509Certificate>AAAA<!-- -->AAAA</X509Certificate></X509Data>",
             "Element 'X509Certificate' may hold nothing but text."},
        Case{"CommentInSubjectName",
             "<X509Data><X509SubjectName>CN=a<!-- -->.b</X509SubjectName></X509Data>",
             "Element 'X509SubjectName' may hold nothing but text."},
        Case{"HalfAnIssuerSerial",
             "<X509Data><X509IssuerSerial><X509IssuerName>CN=a</X509IssuerName>"
             "</X509IssuerSerial></X509Data>",
             "Element 'X509IssuerSerial' ends where 'X509SerialNumber' of XML-Signature is "
             "expected."},
        Case{"AttributeOfCertificate",
             "<X509Data><X509Certificate Id=\"x\">AAAA</X509Certificate></X509Data>",
             "Element 'X509Certificate' has the unexpected attribute 'Id'."},
        Case{"MoreInIssuerSerial",
             "<X509Data><X509IssuerSerial><X509IssuerName>CN=a</X509IssuerName>"
             "<X509SerialNumber>1</X509SerialNumber><X509SerialNumber>2</X509SerialNumber>"
             "</X509IssuerSerial></X509Data>",
             "Element 'X509IssuerSerial' holds the unexpected element 'X509SerialNumber'."}),
    [](const auto& tested) { return tested.param.name; });

TEST(KeyInfoReaderTest, RefusesUnknownAttributes) {
  EXPECT_EQ(ReadError("<KeyName/>", " Type=\"x\""),
            "Element 'KeyInfo' has the unexpected attribute 'Type'.");
  EXPECT_EQ(ReadError("<KeyName/>"), "accepted");
}

TEST(KeyInfoReaderTest, RefusesUnknownAttributesOfItsParts) {
  const std::string content =
      "<KeyName>n</KeyName><X509Data><X509IssuerSerial><X509IssuerName>CN=a</X509IssuerName>"
      "<X509SerialNumber>1</X509SerialNumber></X509IssuerSerial><X509SKI>AQI=</X509SKI>"
      "<X509SubjectName>CN=b</X509SubjectName><X509Certificate>AQID</X509Certificate></X509Data>";
  ASSERT_EQ(ReadError(content), "accepted");
  for (const std::string element :
       {"KeyName", "X509Data", "X509IssuerSerial", "X509IssuerName", "X509SerialNumber", "X509SKI",
        "X509SubjectName", "X509Certificate"}) {
    std::string edited = content;
    edited.insert(edited.find("<" + element + ">") + 1 + element.size(), " Id=\"x\"");
    EXPECT_EQ(ReadError(edited), "Element '" + element + "' has the unexpected attribute 'Id'.");
  }
}

// Only the expanded name refers to a key elsewhere.
TEST(KeyInfoReaderTest, SkipsElementsThatShareHalfTheNameOfAReference) {
  EXPECT_EQ(ReadError("<o:KeyInfoReference xmlns:o=\"urn:other\"/>"), "accepted");
  EXPECT_EQ(ReadError("<d:Other xmlns:d=\"http://www.w3.org/2009/xmldsig11#\"/>"), "accepted");
}

}  // namespace
}  // namespace Tarnik::Testing
