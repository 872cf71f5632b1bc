#include "xml/security_header.h"

#include <gmock/gmock.h>
#include <tarnik/text/string_util.h>

#include "support/holder_of_key.h"
#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(BinarySecurityTokenTest, CarriesTheCertificateInOneLine) {
  const auto certificate = Testing::ConfigOf(Testing::KeyCredential()).certificate;
  const std::vector<unsigned char> der(certificate->DerBytes(),
                                       certificate->DerBytes() + certificate->DerLength());
  EXPECT_EQ(Testing::BuiltXml(*BuildBinarySecurityToken("id", *certificate)),
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

}  // namespace
}  // namespace SsoClient
