#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/xml/security/key_hints.h>

#include "crypto/public_key_info.h"
#include "support/key_info_texts.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml::Security;
using testing::ElementsAre;
using testing::IsEmpty;

KeyHints Read(const std::string& content) {
  return ReadKeyHints(ReadHints(content));
}

TEST(KeyHintsTest, AreEmptyWithoutAKeyInfo) {
  const KeyHints hints = ReadKeyHints(KeyInfo());
  EXPECT_THAT(hints.certificateDigests, IsEmpty());
  EXPECT_THAT(hints.publicKeys, IsEmpty());
}

TEST(KeyHintsTest, AreReadInDocumentOrder) {
  const KeyHints hints =
      Read("<KeyName>name</KeyName><d:DEREncodedKeyValue>\nAQID\n</d:DEREncodedKeyValue>" +
           RsaKeyValue("ANI=", "AQAB") +
           "<X509Data><d:X509Digest Algorithm=\"urn:a\">BAU=</d:X509Digest><X509SKI>AQ==</X509SKI>"
           "<d:X509Digest Algorithm=\"urn:b\">Bg==</d:X509Digest></X509Data>" +
           EcKeyValue("urn:oid:1.2.840.10045.3.1.7", "BAEC") +
           "<X509Data><d:X509Digest>Bw==</d:X509Digest></X509Data>");
  EXPECT_THAT(
      hints.publicKeys,
      ElementsAre(ElementsAre(1, 2, 3), Crypto::RsaPublicKeyInfo("\xD2", {"\x01\x00\x01", 3}),
                  Crypto::EcPublicKeyInfo("1.2.840.10045.3.1.7", "\x04\x01\x02")));
  ASSERT_EQ(hints.certificateDigests.size(), 3U);
  EXPECT_EQ(hints.certificateDigests[0].algorithm, "urn:a");
  EXPECT_THAT(hints.certificateDigests[0].value, ElementsAre(4, 5));
  EXPECT_EQ(hints.certificateDigests[1].algorithm, "urn:b");
  EXPECT_THAT(hints.certificateDigests[1].value, ElementsAre(6));
  EXPECT_EQ(hints.certificateDigests[2].algorithm, "");
  EXPECT_THAT(hints.certificateDigests[2].value, ElementsAre(7));
}

TEST(KeyHintsTest, AreEmptyWhenTheyCannotBeRead) {
  const std::string curve = "urn:oid:1.2.840.10045.3.1.7";
  for (const std::string& content :
       {RsaKeyValue("", "AQAB"),
        RsaKeyValue("AA==", "AQAB"),
        RsaKeyValue("no Base64 *", "AQAB"),
        RsaKeyValue("AQ", "AQAB"),
        RsaKeyValue("AQ==", ""),
        RsaKeyValue("AQ==", "AA=="),
        RsaKeyValue("A<!-- -->Q==", "AQAB"),
        RsaKeyValue("AQ==</Modulus><Modulus>AQ==", "AQAB"),
        RsaKeyValue("AQ==", "AQAB</Exponent><Exponent>AQAB"),
        std::string("<KeyValue><RSAKeyValue/></KeyValue>"),
        std::string("<KeyValue>text<RSAKeyValue/></KeyValue>"),
        std::string("<KeyValue><RSAKeyValue>text</RSAKeyValue></KeyValue>"),
        EcKeyValue(curve, ""),
        EcKeyValue(curve, "AgEC"),
        EcKeyValue(curve, "*"),
        EcKeyValue("1.2.840.10045.3.1.7", "BAEC"),
        EcKeyValue("urn:oid:P-256", "BAEC"),
        EcKeyValue("", "BAEC"),
        EcKeyValue(curve, "BAEC</d:PublicKey><d:PublicKey>BAEC"),
        std::string("<KeyValue><d:ECKeyValue><d:ECParameters/></d:ECKeyValue></KeyValue>"),
        std::string("<d:DEREncodedKeyValue/>"),
        std::string("<d:DEREncodedKeyValue>A</d:DEREncodedKeyValue>"),
        std::string("<d:DEREncodedKeyValue><a/></d:DEREncodedKeyValue>")}) {
    EXPECT_THAT(Read(content + RsaKeyValue("AQ==", "AQAB")).publicKeys,
                ElementsAre(IsEmpty(), Crypto::RsaPublicKeyInfo("\x01", {"\x01\x00\x01", 3})))
        << content;
  }
  for (const char* content : {"<d:X509Digest/>", "<d:X509Digest>A</d:X509Digest>",
                              "<d:X509Digest><!-- --></d:X509Digest>"}) {
    const KeyHints hints = Read("<X509Data>" + std::string(content) + "</X509Data>");
    ASSERT_EQ(hints.certificateDigests.size(), 1U) << content;
    EXPECT_THAT(hints.certificateDigests[0].value, IsEmpty());
  }
}

TEST(KeyHintsTest, AreReadOnlyUpToALimit) {
  std::string keys;
  std::string digests;
  for (int i = 0; i < 20; ++i) {
    keys += "<KeyValue><RSAKeyValue/></KeyValue>";
    digests += "<k:X509Digest Algorithm=\"a\">AQ==</k:X509Digest>";
  }
  const std::string begin = "<X509Data xmlns:k=\"http://www.w3.org/2009/xmldsig11#\">";
  const KeyHints hints = ReadKeyHints(
      ReadHints(keys + begin + digests + "</X509Data>" + begin + digests + "</X509Data>"));
  EXPECT_EQ(hints.publicKeys.size(), 16U);
  EXPECT_EQ(hints.certificateDigests.size(), 16U);
}

TEST(KeyHintsTest, OfOtherKindsAreSkipped) {
  for (const char* content :
       {"<KeyValue/>", "<KeyValue><DSAKeyValue/></KeyValue>", "<KeyName>AQID</KeyName>",
        "<KeyValue><o:RSAKeyValue xmlns:o=\"urn:o\">AQID</o:RSAKeyValue></KeyValue>",
        "<o:DEREncodedKeyValue xmlns:o=\"urn:o\">AQID</o:DEREncodedKeyValue>",
        "<o:Other xmlns:o=\"urn:o\"><KeyValue><RSAKeyValue/></KeyValue></o:Other>",
        "<X509Data><o:X509Digest xmlns:o=\"urn:o\">AQID</o:X509Digest></X509Data>",
        "<d:X509Digest>AQID</d:X509Digest>"}) {
    const KeyHints hints = Read(content);
    EXPECT_THAT(hints.publicKeys, IsEmpty()) << content;
    EXPECT_THAT(hints.certificateDigests, IsEmpty()) << content;
  }
}

}  // namespace
}  // namespace Tarnik::Testing
