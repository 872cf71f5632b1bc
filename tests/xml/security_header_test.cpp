#include "xml/security_header.h"

#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/system/date_time.h>
#include <tarnik/text/string_util.h>

#include "support/holder_of_key.h"
#include "support/local_zone.h"
#include "xml/builders.h"
#include "xml/built_xml.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::GetUtcDateTime;

TEST(SecurityHeaderTest, HoldsATimestampInUtcAndThenWhatIsAdded) {
  const LocalZone zone;
  const auto header = BuildSecurityHeader(10);
  header->Add(MakeElementBuilder("", "Token"));
  EXPECT_EQ(WithoutTimes(BuiltXml(*header)),
            "<wsse:Security xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-secext-1.0.xsd\">"
            "<wsu:Timestamp xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-utility-1.0.xsd\"><wsu:Created>TIME</wsu:Created>"
            "<wsu:Expires>TIME</wsu:Expires></wsu:Timestamp><Token/></wsse:Security>");
}

TEST(SecurityHeaderTest, IsValidFromNowForTheRequestedMinutes) {
  const auto before = GetUtcDateTime().GetUtcTime() / 1000;
  const auto header = Built(*BuildSecurityHeader(10));
  const auto after = GetUtcDateTime().GetUtcTime() / 1000;
  const auto created = TimeAt(*header, {"Timestamp", "Created"}).GetUtcTime();
  const auto expires = TimeAt(*header, {"Timestamp", "Expires"}).GetUtcTime();
  EXPECT_LE(before, created / 1000);
  EXPECT_LE(created / 1000, after);
  EXPECT_EQ(expires - created, 600'000'000);
}

TEST(SecurityHeaderTest, WrapsMoreThan35Minutes) {
  const auto header = Built(*BuildSecurityHeader(36));
  // The written times have no microseconds.
  EXPECT_NEAR(TimeAt(*header, {"Timestamp", "Expires"}).GetUtcTime() -
                  TimeAt(*header, {"Timestamp", "Created"}).GetUtcTime(),
              2'160'000'000 - 4'294'967'296, 1000);
}

constexpr char kUsernameTokenStart[] =
    "<wsse:UsernameToken xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-wssecurity-secext-1.0.xsd\">";
constexpr char kPasswordStart[] =
    "<wsse:Password Type=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-username-token-profile-1.0#PasswordText\">";

TEST(UsernameTokenTest, HoldsOnlyTheUser) {
  EXPECT_EQ(BuiltXml(*BuildUsernameToken("alice")),
            std::string(kUsernameTokenStart) +
                "<wsse:Username>alice</wsse:Username></wsse:UsernameToken>");
}

TEST(UsernameTokenTest, HoldsThePasswordInClear) {
  EXPECT_EQ(BuiltXml(*BuildUsernamePasswordToken("a&b", "p<w]]>")),
            std::string(kUsernameTokenStart) + "<wsse:Username>a&amp;b</wsse:Username>" +
                kPasswordStart + "p&lt;w]]&gt;</wsse:Password></wsse:UsernameToken>");
}

TEST(UsernameTokenTest, WritesEmptyTexts) {
  EXPECT_EQ(BuiltXml(*BuildUsernamePasswordToken("", "")),
            std::string(kUsernameTokenStart) + "<wsse:Username></wsse:Username>" + kPasswordStart +
                "</wsse:Password></wsse:UsernameToken>");
}

TEST(BinarySecurityTokenTest, HoldsTheCertificateInOneLine) {
  const auto certificate = ConfigOf(KeyCredential()).certificate;
  const std::vector<unsigned char> der(certificate->DerBytes(),
                                       certificate->DerBytes() + certificate->DerLength());
  EXPECT_EQ(BuiltXml(*BuildBinarySecurityToken("id", *certificate)),
            "<wsse:BinarySecurityToken"
            " EncodingType=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-soap-message-security-1.0#Base64Binary\""
            " ValueType=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-x509-token-profile-1.0#X509v3\""
            " wsu:Id=\"id\""
            " xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-utility-1.0.xsd\">" +
                Tarnik::StringUtil::Base64Encode(der) + "</wsse:BinarySecurityToken>");
}

TEST(SamlTokenReferenceTest, NamesTheAssertionByItsId) {
  EXPECT_EQ(BuiltXml(*BuildSamlTokenReference("_a&b")),
            "<wsse:SecurityTokenReference"
            " wsse11:TokenType=\"http://docs.oasis-open.org/wss/"
            "oasis-wss-saml-tokenprofile-1.1#SAMLV2.0\""
            " xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-secext-1.0.xsd\""
            " xmlns:wsse11=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-secext-1.1.xsd\">"
            "<wsse:KeyIdentifier ValueType=\"http://docs.oasis-open.org/wss/"
            "oasis-wss-saml-token-profile-1.1#SAMLID\">_a&amp;b</wsse:KeyIdentifier>"
            "</wsse:SecurityTokenReference>");
}

}  // namespace
}  // namespace SsoClient::Testing
