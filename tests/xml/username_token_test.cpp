#include "xml/security_header.h"

#include <gmock/gmock.h>

#include "xml/built_xml.h"

namespace SsoClient {
namespace {

constexpr char kStart[] =
    "<wsse:UsernameToken xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-wssecurity-secext-1.0.xsd\">";
constexpr char kPasswordStart[] =
    "<wsse:Password Type=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-username-token-profile-1.0#PasswordText\">";

TEST(UsernameTokenTest, HoldsTheUserAlone) {
  EXPECT_EQ(Testing::BuiltXml(*BuildUsernameToken("alice")),
            std::string(kStart) + "<wsse:Username>alice</wsse:Username></wsse:UsernameToken>");
}

TEST(UsernameTokenTest, HoldsThePasswordInClear) {
  EXPECT_EQ(Testing::BuiltXml(*BuildUsernamePasswordToken("a&b", "p<w]]>")),
            std::string(kStart) + "<wsse:Username>a&amp;b</wsse:Username>" + kPasswordStart +
                "p&lt;w]]&gt;</wsse:Password></wsse:UsernameToken>");
}

TEST(UsernameTokenTest, WritesEmptyTexts) {
  EXPECT_EQ(Testing::BuiltXml(*BuildUsernamePasswordToken("", "")),
            std::string(kStart) + "<wsse:Username></wsse:Username>" + kPasswordStart +
                "</wsse:Password></wsse:UsernameToken>");
}

}  // namespace
}  // namespace SsoClient
