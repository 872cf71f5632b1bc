#include "xml/request_bodies.h"

#include <gmock/gmock.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/fake_saml_token.h"
#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(ValidateBodyTest, HoldsTheTokenAndNothingOfALifetime) {
  const Testing::FakeSamlToken token("<s:Assertion xmlns:s=\"urn:s\"/>");
  EXPECT_EQ(Testing::BuiltXml(*BuildValidateBody(token)),
            "<wst:RequestSecurityToken"
            " xmlns:wst=\"http://docs.oasis-open.org/ws-sx/ws-trust/200512\">"
            "<wst:TokenType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Status"
            "</wst:TokenType>"
            "<wst:RequestType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/Validate"
            "</wst:RequestType>"
            "<wst:ValidateTarget><s:Assertion xmlns:s=\"urn:s\"/></wst:ValidateTarget>"
            "</wst:RequestSecurityToken>");
}

TEST(ValidateBodyTest, RefusesATokenWhoseTextIsMalformed) {
  const Testing::FakeSamlToken token("<A>");
  EXPECT_THROW(Testing::Built(*BuildValidateBody(token)), Tarnik::Xml::XMLParseException);
}

}  // namespace
}  // namespace SsoClient
