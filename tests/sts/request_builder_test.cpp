#include "sts/request_builder.h"

#include <cstdint>
#include <functional>
#include <limits>
#include <memory>
#include <ostream>
#include <string>

#include <boost/none.hpp>
#include <gmock/gmock.h>

#include <devsts/xml_security.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>

#include "sts/request_operations.h"
#include "support/fake_saml_token.h"
#include "support/parse_xml.h"
#include "support/vtable_slot.h"
#include "xml/built_xml.h"
#include "xml/unsendable_texts.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;
using testing::Not;

std::string BuiltBody(const TokenSpec& spec, const std::string& user = "alice",
                      const std::string& password = "pw") {
  SoapRequest request;
  RequestBuilderImpl(boost::none).BuildAcquireTokenRequest(user, password, spec, request);
  return request.body;
}

TEST(RequestBuilderImplTest, APasswordRequestIsAnUnsignedEnvelopeThatAsksForABearerToken) {
  SoapRequest request;
  RequestBuilderImpl(boost::none).BuildAcquireTokenRequest("alice", "p<w", SpecOf(3600), request);
  EXPECT_EQ(request.action, kIssueAction);
  EXPECT_EQ(
      WithoutTimes(request.body),
      "<soapenv:Envelope xmlns:soapenv=\"http://schemas.xmlsoap.org/soap/envelope/\">"
      "<soapenv:Header>"
      "<wsse:Security xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-secext-1.0.xsd\">"
      "<wsu:Timestamp xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-utility-1.0.xsd\"><wsu:Created>TIME</wsu:Created>"
      "<wsu:Expires>TIME</wsu:Expires></wsu:Timestamp>"
      "<wsse:UsernameToken xmlns:wsse=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-secext-1.0.xsd\"><wsse:Username>alice</wsse:Username>"
      "<wsse:Password Type=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-username-token-profile-1.0#PasswordText\">p&lt;w</wsse:Password>"
      "</wsse:UsernameToken></wsse:Security></soapenv:Header>"
      "<soapenv:Body xmlns:wst=\"http://docs.oasis-open.org/ws-sx/ws-trust/200512\">"
      "<wst:RequestSecurityToken xmlns:wst=\"http://docs.oasis-open.org/ws-sx/ws-trust/200512\""
      " xmlns:wst14=\"http://docs.oasis-open.org/ws-sx/ws-trust/200802\">"
      "<wst:TokenType>urn:oasis:names:tc:SAML:2.0:assertion</wst:TokenType>"
      "<wst:RequestType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/Issue</wst:RequestType>"
      "<wst:KeyType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/Bearer</wst:KeyType>"
      "<wst:Lifetime xmlns:wsu=\"http://docs.oasis-open.org/wss/2004/01/"
      "oasis-200401-wss-wssecurity-utility-1.0.xsd\"><wsu:Created>TIME</wsu:Created>"
      "<wsu:Expires>TIME</wsu:Expires></wst:Lifetime>"
      "<wst:Renewing Allow=\"false\" OK=\"false\"/><wst:Delegatable>false</wst:Delegatable>"
      "</wst:RequestSecurityToken></soapenv:Body></soapenv:Envelope>");
}

TEST(RequestBuilderImplTest, TheTimestampIsValidForTenMinutes) {
  const auto document = ParseXml(BuiltBody(SpecOf(60)));
  const auto& header = *document->RootElement()->FirstChildElement("Header");
  EXPECT_EQ(TimeAt(header, {"Security", "Timestamp", "Expires"}).GetUtcTime() -
                TimeAt(header, {"Security", "Timestamp", "Created"}).GetUtcTime(),
            600'000'000);
}

TEST(RequestBuilderImplTest, AnyConfirmationGivesABearerTokenWithoutAKey) {
  for (const auto confirmation : {CONFIRMATION_DEFAULT, CONFIRMATION_BEARER}) {
    auto spec = SpecOf(60);
    spec.confirmation = confirmation;
    spec.actAsToken = std::make_shared<FakeSamlToken>("<A/>");
    const auto body = BuiltBody(spec);
    EXPECT_THAT(body, HasSubstr("/Bearer</wst:KeyType>"));
    EXPECT_THAT(body, HasSubstr("<wst14:ActAs><A/></wst14:ActAs>"));
    EXPECT_THAT(body, Not(HasSubstr("UseKey")));
    EXPECT_THAT(body, Not(HasSubstr("Signature")));
  }
}

TEST(RequestBuilderImplTest, TheLifetimeMustBePositive) {
  for (const std::int64_t seconds :
       {std::int64_t{0}, std::int64_t{-1}, std::numeric_limits<std::int64_t>::min()}) {
    SoapRequest request;
    request.action = "kept";
    request.body = "kept too";
    try {
      RequestBuilderImpl(boost::none)
          .BuildAcquireTokenRequest("alice", "pw", SpecOf(seconds), request);
      ADD_FAILURE() << seconds;
    } catch (const Tarnik::InvalidArgumentException& error) {
      EXPECT_EQ(error.Message(), "Token lifetime must be positive");
    }
    EXPECT_EQ(request.action, "kept");
    EXPECT_EQ(request.body, "kept too");
  }
  EXPECT_NO_THROW(BuiltBody(SpecOf(1)));
  EXPECT_NO_THROW(BuiltBody(SpecOf(std::numeric_limits<std::int64_t>::max())));
}

TEST(RequestBuilderImplTest, EmptyCredentialsAreSentEmpty) {
  EXPECT_THAT(BuiltBody(SpecOf(60), "", ""), HasSubstr("<wsse:Username></wsse:Username>"));
}

TEST(RequestBuilderImplTest, CredentialsThatXmlForbidsAreRefusedByElement) {
  const auto failure = [](const std::string& user, const std::string& password) {
    SoapRequest request;
    try {
      RequestBuilderImpl(boost::none).BuildAcquireTokenRequest(user, password, SpecOf(60), request);
    } catch (const Tarnik::InvalidArgumentException& error) {
      EXPECT_EQ(request.body, "");
      return error.Message();
    }
    return std::string("accepted");
  };
  for (const auto& text : UnsendableTexts()) {
    const auto userFailure = failure(text, "pw");
    EXPECT_THAT(userFailure, HasSubstr("'wsse:Username'"));
    EXPECT_THAT(userFailure, Not(HasSubstr("s3cret")));
    const auto passwordFailure = failure("alice", text);
    EXPECT_THAT(passwordFailure, HasSubstr("'wsse:Password'"));
    EXPECT_THAT(passwordFailure, Not(HasSubstr("s3cret")));
  }
}

TEST(RequestBuilderImplTest, TheOperationIsTheFirstSlot) {
  const RequestBuilderImpl builder(boost::none);
  const RequestBuilder& object = builder;
  SoapRequest request;
  using Build =
      void(const void*, const std::string&, const std::string&, const TokenSpec&, SoapRequest&);
  VtableSlot<Build>(&object, 0)(&object, "alice", "pw", SpecOf(60), request);
  EXPECT_EQ(request.action, kIssueAction);
}

// The values that a caller puts into a request are sent as text, even if they look like markup: an
// independent parser reads them back.
constexpr char kMarkup[] =
    "</a>&amp;&#0;<!--c--><?p?>]]><![CDATA[\"'\r\n\t\xC3\xA4\xF0\x9F\x94\x91 ";

// The form in which Canonical XML (section 2.3) writes it in a text and in an attribute.
constexpr char kInText[] =
    "&lt;/a&gt;&amp;amp;&amp;#0;&lt;!--c--&gt;&lt;?p?&gt;]]&gt;&lt;![CDATA[\"'&#xD;\n\t"
    "\xC3\xA4\xF0\x9F\x94\x91 ";
constexpr char kInAttribute[] =
    "&lt;/a>&amp;amp;&amp;#0;&lt;!--c-->&lt;?p?>]]>&lt;![CDATA[&quot;'&#xD;&#xA;&#x9;"
    "\xC3\xA4\xF0\x9F\x94\x91 ";

struct Input {
  std::string user = "alice";
  std::string password = "pw";
  TokenSpec spec;
};

struct Field {
  const char* name;
  std::function<void(Input&)> put;
  const char* element;
  std::string expected;
};

void PrintTo(const Field& field, std::ostream* stream) {
  *stream << field.name;
}

class RequestEscapingTest : public testing::TestWithParam<Field> {};

TEST_P(RequestEscapingTest, KeepsMarkupAsText) {
  Input input;
  input.spec.tokenLifetimeSec = 60;
  GetParam().put(input);
  SoapRequest request;
  RequestBuilderImpl(boost::none)
      .BuildAcquireTokenRequest(input.user, input.password, input.spec, request);
  const std::string canonical =
      DevSts::Canonicalize(request.body, GetParam().element, DevSts::CanonicalMode::Exclusive);
  EXPECT_THAT(canonical, HasSubstr(GetParam().expected));
}

const std::string kText = std::string(">") + kInText + "</";

INSTANTIATE_TEST_SUITE_P(
    Fields, RequestEscapingTest,
    testing::Values(
        Field{"User", [](Input& input) { input.user = kMarkup; },
              "//*[local-name()='UsernameToken']/*[local-name()='Username']", kText},
        Field{"Password", [](Input& input) { input.password = kMarkup; },
              "//*[local-name()='Password']", kText},
        Field{"Audience", [](Input& input) { input.spec.audienceRestriction = {kMarkup}; },
              "//*[local-name()='Address']", kText},
        Field{"DelegateTo", [](Input& input) { input.spec.delegateTo = std::string(kMarkup); },
              "//*[local-name()='DelegateTo']//*[local-name()='Username']", kText},
        Field{"AdviceSource",
              [](Input& input) {
                input.spec.advice = {{kMarkup, {}}};
              },
              "//*[@AdviceSource]", std::string("AdviceSource=\"") + kInAttribute + "\""},
        Field{"AdviceName",
              [](Input& input) {
                input.spec.advice = {{"s", {{kMarkup, {}}}}};
              },
              "//*[local-name()='Attribute']", std::string("Name=\"") + kInAttribute + "\""},
        Field{"AdviceValue",
              [](Input& input) {
                input.spec.advice = {{"s", {{"n", {kMarkup}}}}};
              },
              "//*[local-name()='AttributeValue']", kText}),
    [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
