#include "xml/request_bodies.h"

#include <cstddef>
#include <cstdint>
#include <limits>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>
#include <tarnik/system/date_time.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "deployment.h"
#include "support/fake_saml_token.h"
#include "support/local_zone.h"
#include "support/parse_xml.h"
#include "xml/built_xml.h"
#include "xml/unsendable_texts.h"

namespace SsoClient::Testing {
namespace {

using Tarnik::System::DateTime;
using Tarnik::System::GetUtcDateTime;
using testing::EndsWith;
using testing::HasSubstr;
using testing::Not;

struct Times {
  DateTime created;
  DateTime expires;
};

Times BuiltTimes(std::int64_t seconds) {
  const auto element = Built(*BuildLifetime(seconds));
  return {TimeAt(*element, {"Created"}), TimeAt(*element, {"Expires"})};
}

TEST(LifetimeTest, HoldsCreatedThenExpiresInUtc) {
  const LocalZone zone;
  EXPECT_EQ(WithoutTimes(BuiltXml(*BuildLifetime(600))),
            "<wst:Lifetime xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
            "oasis-200401-wss-wssecurity-utility-1.0.xsd\">"
            "<wsu:Created>TIME</wsu:Created><wsu:Expires>TIME</wsu:Expires></wst:Lifetime>");
}

TEST(LifetimeTest, IsExactlyAsLongAsRequested) {
  for (const std::int64_t seconds : {1L, 600L, 36L * 60, 86'400L * 365}) {
    const auto times = BuiltTimes(seconds);
    EXPECT_EQ(times.expires.GetUtcTime() - times.created.GetUtcTime(), seconds * 1'000'000);
    EXPECT_EQ(times.created.GetFields().millisecond, times.expires.GetFields().millisecond);
  }
}

TEST(LifetimeTest, BeginsNow) {
  const auto before = GetUtcDateTime().GetUtcTime() / 1000;
  const auto created = BuiltTimes(600).created.GetUtcTime() / 1000;
  const auto after = GetUtcDateTime().GetUtcTime() / 1000;
  EXPECT_LE(before, created);
  EXPECT_LE(created, after);
}

TEST(LifetimeTest, ANegativeOneExpiresBeforeItIsCreated) {
  const auto times = BuiltTimes(-60);
  EXPECT_EQ(times.expires.GetUtcTime() - times.created.GetUtcTime(), -60'000'000);
}

TEST(LifetimeTest, TheLongestOneExpiresAtTheLatestTime) {
  EXPECT_EQ(BuiltTimes(std::numeric_limits<std::int64_t>::max()).expires,
            DateTime::Parse("9999-12-31T23:59:59.999Z"));
}

TEST(ParticipantsTest, HoldsOneParticipantForEachAudienceInOrder) {
  EXPECT_EQ(BuiltXml(*BuildParticipants({"b", "a"})),
            "<wst:Participants xmlns:wsa=\"http://www.w3.org/2005/08/addressing\">"
            "<wst:Participant><wsa:EndpointReference><wsa:Address>a</wsa:Address>"
            "</wsa:EndpointReference></wst:Participant>"
            "<wst:Participant><wsa:EndpointReference><wsa:Address>b</wsa:Address>"
            "</wsa:EndpointReference></wst:Participant></wst:Participants>");
}

TEST(ParticipantsTest, IsAnEmptyElementWithoutAudiences) {
  EXPECT_EQ(BuiltXml(*BuildParticipants({})),
            "<wst:Participants xmlns:wsa=\"http://www.w3.org/2005/08/addressing\"/>");
}

TEST(AdviceBuildersTest, AnAttributeHoldsItsValuesInOrder) {
  EXPECT_EQ(BuiltXml(*BuildAdviceAttribute({"N", {"b", "", "a"}})),
            "<rsa-advice:Attribute Name=\"N\">"
            "<rsa-advice:AttributeValue xsi:type=\"xs:string\">b</rsa-advice:AttributeValue>"
            "<rsa-advice:AttributeValue xsi:type=\"xs:string\"></rsa-advice:AttributeValue>"
            "<rsa-advice:AttributeValue xsi:type=\"xs:string\">a</rsa-advice:AttributeValue>"
            "</rsa-advice:Attribute>");
}

TEST(AdviceBuildersTest, AnAttributeWithoutValuesIsEmpty) {
  EXPECT_EQ(BuiltXml(*BuildAdviceAttribute({"N", {}})), "<rsa-advice:Attribute Name=\"N\"/>");
}

TEST(AdviceBuildersTest, AnAdviceHoldsItsAttributesInOrder) {
  EXPECT_EQ(BuiltXml(*BuildAdvice({"S", {{"z", {}}, {"a", {}}}})),
            "<rsa-advice:Advice AdviceSource=\"S\"><rsa-advice:Attribute Name=\"z\"/>"
            "<rsa-advice:Attribute Name=\"a\"/></rsa-advice:Advice>");
}

constexpr char kUseKey[] = "<wst:UseKey Sig=\"holderOfKeyProofSignature\"/>";

TokenSpec PlainSpec() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  return spec;
}

std::string BodyXml(unsigned keyType, const TokenSpec& spec) {
  return WithoutTimes(BuiltXml(*BuildIssueBody(keyType, spec)));
}

std::string UseKeyBodyXml(unsigned keyType, const TokenSpec& spec) {
  return WithoutTimes(BuiltXml(*BuildIssueBodyWithUseKey(keyType, spec)));
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

TEST(IssueBodyTest, RenewableAndDelegableAreIndependent) {
  auto spec = PlainSpec();
  spec.renewable = true;
  EXPECT_EQ(BodyXml(0, spec), PlainBody("Bearer",
                                        "<wst:Renewing Allow=\"true\" OK=\"false\"/>"
                                        "<wst:Delegatable>false</wst:Delegatable>"));
  spec.renewable = false;
  spec.delegable = true;
  EXPECT_EQ(BodyXml(0, spec), PlainBody("Bearer",
                                        "<wst:Renewing Allow=\"false\" OK=\"false\"/>"
                                        "<wst:Delegatable>true</wst:Delegatable>"));
}

TEST(IssueBodyTest, EveryOptionHasItsPlace) {
  auto spec = PlainSpec();
  spec.renewable = true;
  spec.delegable = true;
  spec.delegateTo = "bob";
  spec.actAsToken = std::make_shared<FakeSamlToken>("<s:Assertion xmlns:s=\"urn:s\"/>");
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

TEST(IssueBodyTest, AnyKeyTypeExceptZeroRequestsAPublicKey) {
  EXPECT_THAT(BodyXml(0, PlainSpec()), HasSubstr("/Bearer</wst:KeyType>"));
  for (const unsigned keyType : {1U, 2U}) {
    EXPECT_THAT(BodyXml(keyType, PlainSpec()),
                HasSubstr("<wst:KeyType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/PublicKey"
                          "</wst:KeyType>"));
  }
}

TEST(IssueBodyTest, UseKeyIsLastForKeyTypeOneOnly) {
  EXPECT_THAT(UseKeyBodyXml(1, PlainSpec()),
              EndsWith(std::string(kUseKey) + "</wst:RequestSecurityToken>"));
  EXPECT_EQ(UseKeyBodyXml(0, PlainSpec()), BodyXml(0, PlainSpec()));
  EXPECT_EQ(UseKeyBodyXml(2, PlainSpec()), BodyXml(2, PlainSpec()));
  EXPECT_THAT(BodyXml(1, PlainSpec()), Not(HasSubstr("UseKey")));
}

TEST(IssueBodyTest, ADelegatedTokenHasNoUseKey) {
  auto spec = PlainSpec();
  for (const char* name : {"bob", ""}) {
    spec.delegateTo = std::string(name);
    EXPECT_EQ(UseKeyBodyXml(1, spec), BodyXml(1, spec));
    EXPECT_THAT(UseKeyBodyXml(1, spec), HasSubstr("/PublicKey</wst:KeyType>"));
  }
}

TEST(IssueBodyTest, UseKeyFollowsAdviceAndParticipants) {
  auto spec = PlainSpec();
  spec.audienceRestriction = {"a"};
  spec.advice = {{"S", {}}};
  EXPECT_THAT(UseKeyBodyXml(1, spec), EndsWith("</rsa-advice:AdviceSet>" + std::string(kUseKey) +
                                               "</wst:RequestSecurityToken>"));
}

TEST(IssueBodyTest, RequestedTimesComeFromTheSpec) {
  auto spec = PlainSpec();
  spec.tokenLifetimeSec = 3600;
  const auto body = Built(*BuildIssueBody(0, spec));
  EXPECT_EQ(TimeAt(*body, {"Lifetime", "Expires"}).GetUtcTime() -
                TimeAt(*body, {"Lifetime", "Created"}).GetUtcTime(),
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
  spec.actAsToken = std::make_shared<FakeSamlToken>("<broken");
  EXPECT_THROW(BuildIssueBody(0, spec), Tarnik::Xml::XMLParseException);
}

TEST(IssueBodyTest, CharactersThatXmlForbidsAreRefusedByElement) {
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
    for (const auto& text : UnsendableTexts()) {
      auto spec = PlainSpec();
      test.put(spec, text);
      try {
        Built(*BuildIssueBody(0, spec));
        ADD_FAILURE() << test.element << " accepted " << testing::PrintToString(text);
      } catch (const Tarnik::InvalidArgumentException& error) {
        EXPECT_THAT(error.Message(), HasSubstr(test.element));
        EXPECT_THAT(error.Message(), Not(HasSubstr("s3cret")));
      }
    }
  }
}

TEST(RenewBodyTest, HoldsTheTokenAndALifetime) {
  const FakeSamlToken token("<s:Assertion xmlns:s=\"urn:s\"/>");
  EXPECT_EQ(WithoutTimes(BuiltXml(*BuildRenewBody(token, 600))),
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

TEST(RenewBodyTest, TheLifetimeIsExactlyAsLongAsRequested) {
  const auto body = Built(*BuildRenewBody(FakeSamlToken("<A/>"), 600));
  EXPECT_EQ(TimeAt(*body, {"Lifetime", "Expires"}).GetUtcTime() -
                TimeAt(*body, {"Lifetime", "Created"}).GetUtcTime(),
            600'000'000);
}

TEST(RenewBodyTest, RefusesATokenWhoseTextIsMalformed) {
  const FakeSamlToken token("<A>");
  EXPECT_THROW(Built(*BuildRenewBody(token, 600)), Tarnik::Xml::XMLParseException);
}

TEST(ValidateBodyTest, HoldsTheTokenAndNoLifetime) {
  const FakeSamlToken token("<s:Assertion xmlns:s=\"urn:s\"/>");
  EXPECT_EQ(BuiltXml(*BuildValidateBody(token)),
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
  const FakeSamlToken token("<A>");
  EXPECT_THROW(Built(*BuildValidateBody(token)), Tarnik::Xml::XMLParseException);
}

constexpr char kExchangeStart[] =
    "<wst:BinaryExchange EncodingType=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-soap-message-security-1.0#Base64Binary\""
    " ValueType=\"http://schemas.xmlsoap.org/ws/2005/02/trust/spnego\">";

TEST(BinaryExchangeTest, HoldsTheLegInBase64) {
  EXPECT_EQ(BuiltXml(*BuildBinaryExchange({0x00, 0xFF, 0x10, 0x80})),
            std::string(kExchangeStart) + "AP8QgA==</wst:BinaryExchange>");
}

TEST(BinaryExchangeTest, AnEmptyLegIsAnEmptyText) {
  EXPECT_EQ(BuiltXml(*BuildBinaryExchange({})),
            std::string(kExchangeStart) + "</wst:BinaryExchange>");
}

TokenSpec OneMinute() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 60;
  return spec;
}

std::string ContextOf(const Tarnik::Xml::ElementNode& element) {
  return std::string(element.FindAttribute("Context").value_or("none"));
}

TEST(XMLBodyBuilderInitialSPNegoTest, IsAnIssueBodyFollowedByTheLegAndWithAContext) {
  for (const unsigned keyType : {0U, 1U}) {
    const auto element = Built(XMLBodyBuilderInitialSPNego(keyType, OneMinute(), {1, 2, 3}));
    const auto expected = BuildIssueBodyWithUseKey(keyType, OneMinute());
    expected->Add(BuildBinaryExchange({1, 2, 3}));
    const auto attribute = " Context=\"" + ContextOf(*element) + "\"";
    auto xml = XmlText(element.get());
    // After the declarations.
    const std::size_t position = xml.find(attribute + ">");
    ASSERT_NE(position, std::string::npos);
    xml.erase(position, attribute.size());
    EXPECT_EQ(WithoutTimes(xml), WithoutTimes(BuiltXml(*expected)));
  }
}

TEST(XMLBodyBuilderInitialSPNegoTest, TheUseKeyPrecedesTheLeg) {
  const auto xml = BuiltXml(XMLBodyBuilderInitialSPNego(1, OneMinute(), {1}));
  EXPECT_LT(xml.find("<wst:UseKey"), xml.find("<wst:BinaryExchange"));
  EXPECT_THAT(BuiltXml(XMLBodyBuilderInitialSPNego(0, OneMinute(), {1})), Not(HasSubstr("UseKey")));
}

TEST(XMLBodyBuilderInitialSPNegoTest, KeepsACopyOfTheSpecAndTheLeg) {
  auto spec = OneMinute();
  std::vector<unsigned char> leg{1};
  const XMLBodyBuilderInitialSPNego builder(0, spec, leg);
  spec.renewable = true;
  leg.clear();
  const auto xml = BuiltXml(builder);
  EXPECT_THAT(xml, HasSubstr("<wst:Renewing Allow=\"false\" OK=\"false\"/>"));
  EXPECT_THAT(xml, HasSubstr(">AQ==</wst:BinaryExchange></wst:RequestSecurityToken>"));
}

TEST(XMLBodyBuilderInitialSPNegoTest, AnEmptyLegIsSentEmpty) {
  EXPECT_THAT(BuiltXml(XMLBodyBuilderInitialSPNego(0, OneMinute(), {})),
              HasSubstr(BuiltXml(*BuildBinaryExchange({}))));
}

TEST(XMLBodyBuilderInitialSPNegoTest, EachBuildDrawsANewContext) {
  const XMLBodyBuilderInitialSPNego builder(0, OneMinute(), {1});
  const auto first = ContextOf(*Built(builder));
  EXPECT_THAT(first, testing::MatchesRegex("urn:uuid:[0-9a-f-]{36}"));
  EXPECT_NE(first, ContextOf(*Built(builder)));
}

TEST(XMLBodyBuilderContinuedSPNegoTest, IsABareResponseWithTheLegAndTheContext) {
  EXPECT_EQ(BuiltXml(XMLBodyBuilderContinuedSPNego("urn:c\"<", {1, 2})),
            "<wst:RequestSecurityTokenResponse Context=\"urn:c&quot;&lt;\">" +
                BuiltXml(*BuildBinaryExchange({1, 2})) + "</wst:RequestSecurityTokenResponse>");
}

}  // namespace
}  // namespace SsoClient::Testing
