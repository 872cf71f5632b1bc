#include "xml/security/signer_description.h"

#include <string>
#include <vector>

#include <gtest/gtest.h>

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

}  // namespace
}  // namespace Tarnik::Testing
