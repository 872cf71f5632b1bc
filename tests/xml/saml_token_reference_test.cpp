#include "xml/security_header.h"

#include <gmock/gmock.h>

#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(SamlTokenReferenceTest, NamesTheAssertionByItsId) {
  EXPECT_EQ(Testing::BuiltXml(*BuildSamlTokenReference("_a&b")),
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
}  // namespace SsoClient
