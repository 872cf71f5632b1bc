#include "xml/security/signer_description.h"

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/text/string_util.h>

#include "support/key_info_texts.h"
#include "support/test_pki.h"

namespace Tarnik::Testing {
namespace {

using Xml::Security::DescribeSigner;
using Xml::Security::KeyInfo;

TEST(SignerDescriptionTest, NamesTheFirstCertificate) {
  IdentityOptions options;
  options.commonName = "Prüfer\nx";
  const auto certificate = MakeIdentity(options, nullptr).ToCertificate();
  KeyInfo keyInfo;
  keyInfo.certificates = {
      {certificate->DerBytes(), certificate->DerBytes() + certificate->DerLength()}, {1, 2, 3}};
  keyInfo.subjectNames = {"another"};
  EXPECT_EQ(DescribeSigner(keyInfo),
            "whose certificate is of 'CN=Prüfer\\0Ax', issued by 'CN=Prüfer\\0Ax' with the serial "
            "number '" +
                certificate->SerialNumber() + "'");
  keyInfo.certificates = {{1, 2, 3}};
  EXPECT_EQ(DescribeSigner(keyInfo), "whose certificate cannot be read");
}

TEST(SignerDescriptionTest, BoundsAndCleansWhatTheMessageSays) {
  KeyInfo keyInfo;
  keyInfo.issuerSerials = {{std::string(60000, 'x') + "\n", "12\r\n" + std::string(60000, '9')}};
  EXPECT_EQ(DescribeSigner(keyInfo), "whose certificate was issued by '" + std::string(256, 'x') +
                                         "...' with the serial number '12??" +
                                         std::string(60, '9') + "...'");
  keyInfo.issuerSerials = {{"CN=sts", "12"}};
  EXPECT_EQ(DescribeSigner(keyInfo),
            "whose certificate was issued by 'CN=sts' with the serial number '12'");
}

TEST(SignerDescriptionTest, BoundsEveryHint) {
  const std::string name = "'" + std::string(256, 'x') + "...'";
  KeyInfo keyInfo;
  keyInfo.keyNames = {std::string(257, 'x')};
  EXPECT_EQ(DescribeSigner(keyInfo), "whose key is named " + name);
  keyInfo.subjectNames = {std::string(257, 'x')};
  EXPECT_EQ(DescribeSigner(keyInfo), "whose certificate is of " + name);
  keyInfo.subjectKeyIdentifiers = {std::vector<unsigned char>(32, 0x11)};
  EXPECT_EQ(DescribeSigner(keyInfo),
            "whose signer has the subject key identifier '" + std::string(64, '1') + "'");
}

TEST(SignerDescriptionTest, NamesTheOtherHints) {
  KeyInfo keyInfo;
  EXPECT_EQ(DescribeSigner(keyInfo), "which names no signer");
  keyInfo.keyNames = {"key\x1b"};
  EXPECT_EQ(DescribeSigner(keyInfo), "whose key is named 'key?'");
  keyInfo.subjectNames = {"CN=sts", "CN=other"};
  EXPECT_EQ(DescribeSigner(keyInfo), "whose certificate is of 'CN=sts'");
  keyInfo.subjectKeyIdentifiers = {{0x0a, 0xff}};
  EXPECT_EQ(DescribeSigner(keyInfo), "whose signer has the subject key identifier '0aff'");
  keyInfo.subjectKeyIdentifiers = {std::vector<unsigned char>(33, 0x11)};
  EXPECT_EQ(DescribeSigner(keyInfo),
            "whose signer has the subject key identifier '" + std::string(64, '1') + "...'");
}

TEST(SignerDescriptionTest, NamesAKeyByItsHashAndACertificateByItsDigest) {
  // printf '\001\002\003' | openssl dgst -sha256
  const std::string hash = "039058c6f2c0cb492c533b0a4d14ef77cc0f78abccced5287d84a1a2011cfb81";
  const std::string key = "<d:DEREncodedKeyValue>AQID</d:DEREncodedKeyValue>";
  EXPECT_EQ(DescribeSigner(ReadHints("<KeyName>name</KeyName>" + key + key)),
            "whose key has the SHA-256 hash '" + hash + "'");
  EXPECT_EQ(DescribeSigner(ReadHints("<d:DEREncodedKeyValue/>" + key)), "whose key cannot be read");
  EXPECT_EQ(DescribeSigner(ReadHints(DigestText("urn:x", "AQID") + key)),
            "whose key has the SHA-256 hash '" + hash + "'");
  EXPECT_EQ(
      DescribeSigner(ReadHints(key + DigestText("urn:x", "AA==") + DigestText(kSha384Uri, "AQL/"))),
      "whose certificate has the digest '0102ff' by "
      "'http://www.w3.org/2001/04/xmldsig-more#sha384'");
  EXPECT_EQ(DescribeSigner(ReadHints(DigestText(kSha256Uri, "*"))),
            "whose certificate has a digest that cannot be read");
  const std::string longest = StringUtil::Base64Encode(std::vector<unsigned char>(65, 0x11));
  EXPECT_EQ(DescribeSigner(ReadHints(DigestText(kSha256Uri, longest))),
            "whose certificate has the digest '" + std::string(128, '1') +
                "...' by 'http://www.w3.org/2001/04/xmlenc#sha256'");
}

}  // namespace
}  // namespace Tarnik::Testing
