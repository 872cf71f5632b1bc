#include "xml/request_bodies.h"

#include <gmock/gmock.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/fake_saml_token.h"
#include "xml/built_xml.h"

namespace SsoClient {
namespace {

TEST(RenewBodyTest, HoldsTheTokenAndALifetime) {
  const Testing::FakeSamlToken token("<s:Assertion xmlns:s=\"urn:s\"/>");
  EXPECT_EQ(Testing::WithoutTimes(Testing::BuiltXml(*BuildRenewBody(token, 600))),
            "<wst:RequestSecurityToken"
            " xmlns:wst=\"http://docs.oasis-open.org/ws-sx/ws-trust/200512\">"
            "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>"
            "<wst:RequestType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/Renew"
            "</wst:RequestType>"
            "<wst:Lifetime xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-utility-1.0.xsd\">"
            "<wsu:Created>TIME</wsu:Created><wsu:Expires>TIME</wsu:Expires></wst:Lifetime>"
            "<wst:RenewTarget><s:Assertion xmlns:s=\"urn:s\"/></wst:RenewTarget>"
            "</wst:RequestSecurityToken>");
}

TEST(RenewBodyTest, TheLifetimeIsExactlyAsLongAsAsked) {
  const auto body = Testing::Built(*BuildRenewBody(Testing::FakeSamlToken("<A/>"), 600));
  EXPECT_EQ(Testing::TimeAt(*body, {"Lifetime", "Expires"}).GetUtcTime() -
                Testing::TimeAt(*body, {"Lifetime", "Created"}).GetUtcTime(),
            600'000'000);
}

TEST(RenewBodyTest, RefusesATokenWhoseTextIsMalformed) {
  const Testing::FakeSamlToken token("<A>");
  EXPECT_THROW(Testing::Built(*BuildRenewBody(token, 600)), Tarnik::Xml::XMLParseException);
}

}  // namespace
}  // namespace SsoClient
