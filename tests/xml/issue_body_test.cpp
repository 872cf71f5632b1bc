#include "xml/request_bodies.h"

#include <gmock/gmock.h>
#include <tarnik/core/exception.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "deployment.h"
#include "support/fake_saml_token.h"
#include "xml/built_xml.h"
#include "xml/unsendable_texts.h"

namespace SsoClient {
namespace {

using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;

constexpr char kUseKey[] = "<wst:UseKey Sig=\"holderOfKeyProofSignature\"/>";

TokenSpec PlainSpec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  return spec;
}

std::string BodyXml(unsigned keyType, const TokenSpec& spec) {
  return Testing::WithoutTimes(Testing::BuiltXml(*BuildIssueBody(keyType, spec)));
}

std::string UseKeyBodyXml(unsigned keyType, const TokenSpec& spec) {
  return Testing::WithoutTimes(Testing::BuiltXml(*BuildIssueBodyWithUseKey(keyType, spec)));
}

std::string PlainBody(const std::string& keyType, const std::string& rest) {
  return "<wst:RequestSecurityToken"
         " xmlns:wst=\"http://docs.oasis-open.org/ws-sx/ws-trust/200512\""
         " xmlns:wst14=\"http://docs.oasis-open.org/ws-sx/ws-trust/200802\">"
         "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>"
         "<wst:RequestType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/Issue"
         "</wst:RequestType>"
         "<wst:KeyType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/" +
         keyType +
         "</wst:KeyType>"
         "<wst:Lifetime xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
         "oasis-200401-wss-wssecurity-utility-1.0.xsd\">"
         "<wsu:Created>TIME</wsu:Created><wsu:Expires>TIME</wsu:Expires></wst:Lifetime>" +
         rest + "</wst:RequestSecurityToken>";
}

TEST(IssueBodyTest, APlainSpecGivesTheSixElementsInOrder) {
  EXPECT_EQ(BodyXml(0, PlainSpec()), PlainBody("Bearer",
                                               "<wst:Renewing Allow=\"false\" OK=\"false\"/>"
                                               "<wst:Delegatable>false</wst:Delegatable>"));
}

TEST(IssueBodyTest, EveryOptionHasItsPlace) {
  auto spec = PlainSpec();
  spec.renewable = true;
  spec.delegable = true;
  spec.delegateTo = "bob";
  spec.actAsToken = std::make_shared<Testing::FakeSamlToken>("<s:Assertion xmlns:s=\"urn:s\"/>");
  spec.audienceRestriction = {"b", "a"};
  spec.advice = {{"S2", {{"N", {"v"}}}}, {"S1", {}}};
  EXPECT_EQ(
      BodyXml(1, spec),
      PlainBody("PublicKey",
                "<wst:Renewing Allow=\"true\" OK=\"false\"/>"
                "<wst:Delegatable>true</wst:Delegatable>"
                "<wst:DelegateTo><wsse:UsernameToken xmlns:wsse=\"http://docs.oasis-open.org/wss/"
                "2004/01/oasis-200401-wss-wssecurity-secext-1.0.xsd\">"
                "<wsse:Username>bob</wsse:Username></wsse:UsernameToken></wst:DelegateTo>"
                "<wst14:ActAs><s:Assertion xmlns:s=\"urn:s\"/></wst14:ActAs>"
                "<wst:Participants xmlns:wsa=\"http://www.w3.org/2005/08/addressing\">"
                "<wst:Participant><wsa:EndpointReference><wsa:Address>a</wsa:Address>"
                "</wsa:EndpointReference></wst:Participant>"
                "<wst:Participant><wsa:EndpointReference><wsa:Address>b</wsa:Address>"
                "</wsa:EndpointReference></wst:Participant></wst:Participants>"
                "<rsa-advice:AdviceSet xmlns:rsa-advice=\"" +
                    std::string(kVendorAdviceNamespace) +
                    "\" xmlns:saml=\"urn:oasis:names:tc:SAML:2.0:assertion\""
                    " xmlns:xs=\"http://www.w3.org/2001/XMLSchema\""
                    " xmlns:xsi=\"http://www.w3.org/2001/XMLSchema-instance\">"
                    "<rsa-advice:Advice AdviceSource=\"S2\"><rsa-advice:Attribute Name=\"N\">"
                    "<rsa-advice:AttributeValue xsi:type=\"xs:string\">v"
                    "</rsa-advice:AttributeValue></rsa-advice:Attribute></rsa-advice:Advice>"
                    "<rsa-advice:Advice AdviceSource=\"S1\"/></rsa-advice:AdviceSet>"));
}

TEST(IssueBodyTest, TheAdviceNamespaceIsTheVendors) {
  EXPECT_THAT(kVendorAdviceNamespace,
              testing::MatchesRegex("http://[^/]+/names/2009/12/std-ext/WS-Trust1[.]4/advice"));
}

TEST(IssueBodyTest, AnyKeyTypeButZeroAsksForAPublicKey) {
  EXPECT_THAT(BodyXml(0, PlainSpec()), HasSubstr("/Bearer</wst:KeyType>"));
  for (const unsigned keyType : {1U, 2U}) {
    EXPECT_THAT(BodyXml(keyType, PlainSpec()),
                HasSubstr("<wst:KeyType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/PublicKey"
                          "</wst:KeyType>"));
  }
}

TEST(IssueBodyTest, UseKeyStandsLastForKeyTypeOneAlone) {
  EXPECT_THAT(UseKeyBodyXml(1, PlainSpec()),
              EndsWith(std::string(kUseKey) + "</wst:RequestSecurityToken>"));
  EXPECT_EQ(UseKeyBodyXml(0, PlainSpec()), BodyXml(0, PlainSpec()));
  EXPECT_EQ(UseKeyBodyXml(2, PlainSpec()), BodyXml(2, PlainSpec()));
  EXPECT_THAT(BodyXml(1, PlainSpec()), Not(HasSubstr("UseKey")));
}

TEST(IssueBodyTest, ADelegatedTokenHasNoUseKey) {
  auto spec = PlainSpec();
  spec.delegateTo = "bob";
  EXPECT_EQ(UseKeyBodyXml(1, spec), BodyXml(1, spec));
  EXPECT_THAT(UseKeyBodyXml(1, spec), HasSubstr("/PublicKey</wst:KeyType>"));
}

TEST(IssueBodyTest, UseKeyFollowsAdviceAndParticipants) {
  auto spec = PlainSpec();
  spec.audienceRestriction = {"a"};
  spec.advice = {{"S", {}}};
  EXPECT_THAT(UseKeyBodyXml(1, spec), EndsWith("</rsa-advice:AdviceSet>" + std::string(kUseKey) +
                                               "</wst:RequestSecurityToken>"));
}

TEST(IssueBodyTest, AskedTimesComeFromTheSpec) {
  auto spec = PlainSpec();
  spec.tokenLifetimeSec = 3600;
  const auto body = Testing::Built(*BuildIssueBody(0, spec));
  EXPECT_EQ(Testing::TimeAt(*body, {"Lifetime", "Expires"}).GetUtcTime() -
                Testing::TimeAt(*body, {"Lifetime", "Created"}).GetUtcTime(),
            3'600'000'000);
}

TEST(IssueBodyTest, AnEmptyDelegateIsSentEmpty) {
  auto spec = PlainSpec();
  spec.delegateTo = "";
  EXPECT_THAT(BodyXml(0, spec), HasSubstr("<wsse:Username></wsse:Username>"));
}

TEST(IssueBodyTest, TheActAsTokenMustBeAToken) {
  auto spec = PlainSpec();
  spec.actAsToken = std::shared_ptr<const SamlToken>();
  try {
    BuildIssueBody(0, spec);
    FAIL();
  } catch (const Tarnik::InvalidArgumentException& error) {
    EXPECT_EQ(error.Message(), "TokenSpec::actAsToken is set, but holds no token");
  }
  spec.actAsToken = std::make_shared<Testing::FakeSamlToken>("<broken");
  EXPECT_THROW(BuildIssueBody(0, spec), Tarnik::Xml::XMLParseException);
}

TEST(IssueBodyTest, WhatXmlCannotCarryIsRefusedByElement) {
  const struct {
    const char* element;
    void (*put)(TokenSpec&, const std::string&);
  } kCases[] = {
      {"'wsse:Username'", [](TokenSpec& spec, const std::string& text) { spec.delegateTo = text; }},
      {"'wsa:Address'",
       [](TokenSpec& spec, const std::string& text) { spec.audienceRestriction = {text}; }},
      {"'AdviceSource' of element 'rsa-advice:Advice'",
       [](TokenSpec& spec, const std::string& text) {
         spec.advice = {{text, {}}};
       }},
      {"'Name' of element 'rsa-advice:Attribute'",
       [](TokenSpec& spec, const std::string& text) {
         spec.advice = {{"S", {{text, {}}}}};
       }},
      {"'rsa-advice:AttributeValue'",
       [](TokenSpec& spec, const std::string& text) {
         spec.advice = {{"S", {{"N", {text}}}}};
       }},
  };
  for (const auto& test : kCases) {
    for (const auto& text : Testing::UnsendableTexts()) {
      auto spec = PlainSpec();
      test.put(spec, text);
      try {
        Testing::Built(*BuildIssueBody(0, spec));
        ADD_FAILURE() << test.element << " accepted " << testing::PrintToString(text);
      } catch (const Tarnik::InvalidArgumentException& error) {
        EXPECT_THAT(error.Message(), HasSubstr(test.element));
        EXPECT_THAT(error.Message(), Not(HasSubstr("s3cret")));
      }
    }
  }
}

}  // namespace
}  // namespace SsoClient
