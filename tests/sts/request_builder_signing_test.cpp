#include <chrono>
#include <cstdint>
#include <memory>
#include <regex>
#include <string>
#include <vector>

#include <boost/none.hpp>
#include <gmock/gmock.h>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <ssoclient/saml_token.h>
#include <ssoclient/token_spec.h>
#include <tarnik/core/exception.h>
#include <tarnik/xml/element_node.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "sts/request_builder.h"
#include "sts/request_operations.h"
#include "support/fake_saml_token.h"
#include "support/holder_of_key.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"
#include "xml/built_xml.h"
#include "xml/request_bodies.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;
using Tarnik::InvalidArgumentException;
using Tarnik::InvalidStateException;
using testing::HasSubstr;
using testing::Not;

TEST(RequestSigningActionTest, EachOperationHasItsAction) {
  const auto builder = BuilderWithKey();
  const auto action = [&](const BuildOperation& operation) {
    SoapRequest request;
    operation(builder, SpecOf(60), request);
    return request.action;
  };
  EXPECT_EQ(action(ByPassword), kIssueAction);
  EXPECT_EQ(action(InitialLeg), kIssueAction);
  EXPECT_EQ(action(ContinuedLeg), "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/Issue");
  EXPECT_EQ(action(ByCertificate), kIssueAction);
  EXPECT_EQ(action(ByToken), kIssueAction);
  EXPECT_EQ(action(Validate), kValidateAction);
  EXPECT_EQ(action(Renew), kRenewAction);
}

std::string WithoutContext(const std::string& xml) {
  static const std::regex drawn(" Context=\"urn:uuid:[-0-9a-f]{36}\"");
  return std::regex_replace(xml, drawn, " Context=\"DRAWN\"");
}

std::string BodyOf(const std::string& envelope) {
  const auto document = ParseXml(envelope);
  const auto body = XmlText(document->RootElement()->FirstChildElement("Body")->FirstChild());
  return WithoutContext(WithoutTimes(body));
}

TEST(RequestSigningBodyTest, IsThatOfTheOperation) {
  const auto expected = [](const XMLBaseBuilder& builder) {
    return WithoutContext(WithoutTimes(BuiltXml(builder)));
  };
  const auto token = PresentedToken();
  const auto builder = BuilderWithKey();
  const auto body = [&](const BuildOperation& operation, const TokenSpec& spec) {
    SoapRequest request;
    operation(builder, spec, request);
    return BodyOf(request.body);
  };
  auto spec = SpecOf(60);
  spec.audienceRestriction = {"urn:audience"};
  EXPECT_EQ(body(ByPassword, spec), expected(*BuildIssueBodyWithUseKey(1, spec)));
  EXPECT_EQ(body(InitialLeg, spec), expected(XMLBodyBuilderInitialSPNego(1, spec, {1})));
  EXPECT_EQ(body(ContinuedLeg, spec), expected(XMLBodyBuilderContinuedSPNego("c", {1})));
  EXPECT_EQ(body(ByCertificate, spec), expected(*BuildIssueBodyWithUseKey(1, spec)));
  EXPECT_EQ(body(ByToken, spec), expected(*BuildIssueBody(1, spec)));
  EXPECT_EQ(body(Validate, spec), expected(*BuildValidateBody(token)));
  EXPECT_EQ(body(Renew, spec), expected(*BuildRenewBody(token, 60)));
  spec.confirmation = CONFIRMATION_BEARER;
  EXPECT_EQ(body(ByPassword, spec), expected(*BuildIssueBodyWithUseKey(0, spec)));
  EXPECT_EQ(body(InitialLeg, spec), expected(XMLBodyBuilderInitialSPNego(0, spec, {1})));
  EXPECT_EQ(body(ByToken, spec), expected(*BuildIssueBody(0, spec)));
}

std::int64_t Microseconds(const Tarnik::Xml::ElementNode& envelope, const char* part,
                          const char* container, const char* element) {
  return TimeAt(envelope, {part, container, element, "Expires"}).GetUtcTime() -
         TimeAt(envelope, {part, container, element, "Created"}).GetUtcTime();
}

TEST(RequestSigningTimesTest, EveryTimestampIsValidForTenMinutes) {
  for (const BuildOperation& operation : AllOperations()) {
    SoapRequest request;
    operation(BuilderWithKey(), SpecOf(60), request);
    const auto document = ParseXml(request.body);
    EXPECT_EQ(Microseconds(*document->RootElement(), "Header", "Security", "Timestamp"),
              600'000'000);
  }
}

TEST(RequestSigningTimesTest, TheRequestedLifetimeIsThatOfTheSpecOrTheRenewal) {
  for (const BuildOperation& operation :
       {BuildOperation(ByPassword), BuildOperation(InitialLeg), BuildOperation(ByCertificate),
        BuildOperation(ByToken), BuildOperation(Renew)}) {
    for (const std::int64_t seconds : {1, 77}) {
      SoapRequest request;
      operation(BuilderWithKey(), SpecOf(seconds), request);
      const auto document = ParseXml(request.body);
      EXPECT_EQ(Microseconds(*document->RootElement(), "Body", "RequestSecurityToken", "Lifetime"),
                seconds * 1'000'000);
    }
  }
}

TEST(RequestSigningOrderTest, TheLifetimeIsCheckedFirst) {
  for (const bool hasKey : {false, true}) {
    const auto builder = hasKey ? BuilderWithKey() : RequestBuilderImpl(boost::none);
    for (const BuildOperation& operation :
         {BuildOperation(ByPassword), BuildOperation(InitialLeg), BuildOperation(ByCertificate),
          BuildOperation(ByToken), BuildOperation(Renew)}) {
      for (const std::int64_t seconds : {0, -1}) {
        SoapRequest request;
        EXPECT_EQ(ThrownMessage<InvalidArgumentException>(
                      [&] { operation(builder, SpecOf(seconds, CONFIRMATION_BEARER), request); }),
                  "Token lifetime must be positive");
      }
    }
  }
}

TEST(RequestSigningOrderTest, ABearerTokenIsNotRenewedWhateverTheKey) {
  SoapRequest request;
  EXPECT_EQ(ThrownMessage<InvalidArgumentException>(
                [&] { BuilderWithKey().BuildRenewRequest(PresentedToken(BEARER), 60, request); }),
            "Unable to renew token: the provided token must be Holder Of Key");
  EXPECT_EQ(
      ThrownMessage<InvalidStateException>([&] {
        RequestBuilderImpl(boost::none).BuildRenewRequest(PresentedToken(BEARER), 60, request);
      }),
      kNoKeyForRenewal);
}

TEST(RequestSigningOrderTest, TheTokensTextIsReadLast) {
  FakeSamlToken broken("<A>");
  SoapRequest request;
  const RequestBuilderImpl withoutKey(boost::none);
  EXPECT_EQ(ThrownMessage<InvalidStateException>(
                [&] { withoutKey.BuildAcquireTokenByTokenRequest(broken, SpecOf(60), request); }),
            "No HolderOfKeyConfig provided. Unable to acquire token by token");
  EXPECT_EQ(ThrownMessage<InvalidArgumentException>(
                [&] { BuilderWithKey().BuildRenewRequest(broken, 60, request); }),
            "Unable to renew token: the provided token must be Holder Of Key");
  broken.confirmationType = HOLDER_OF_KEY;
  EXPECT_EQ(ThrownMessage<InvalidStateException>(
                [&] { withoutKey.BuildRenewRequest(broken, 60, request); }),
            kNoKeyForRenewal);
  EXPECT_THROW(BuilderWithKey().BuildRenewRequest(broken, 60, request),
               Tarnik::Xml::XMLParseException);
}

TEST(RequestSigningOrderTest, TheConfirmationOfAPresentedTokenIsNotExamined) {
  SoapRequest request;
  BuilderWithKey().BuildAcquireTokenByTokenRequest(PresentedToken(BEARER), SpecOf(60), request);
  EXPECT_THAT(HeaderOf(request.body), testing::ElementsAre(kTimestamp, kAssertion, kSignature));
}

TEST(RequestSigningTokenTest, TheSignatureNamesThePresentedToken) {
  SoapRequest request;
  ByToken(BuilderWithKey(), SpecOf(60), request);
  EXPECT_THAT(request.body, HasSubstr("#SAMLID\">_presented</wsse:KeyIdentifier>"));
  EXPECT_THAT(request.body, HasSubstr("<Assertion ID=\"_presented\"/>"));
}

TEST(RequestSigningTokenTest, AMalformedTokenTextLeavesTheRequestUnchanged) {
  const FakeSamlToken broken("<A>");
  SoapRequest request;
  EXPECT_THROW(BuilderWithKey().BuildValidateRequest(broken, request),
               Tarnik::Xml::XMLParseException);
  EXPECT_THROW(BuilderWithKey().BuildAcquireTokenByTokenRequest(broken, SpecOf(60), request),
               Tarnik::Xml::XMLParseException);
  EXPECT_EQ(request.body, "");
}

FakeSamlToken TokenWith(const std::string& attributes) {
  FakeSamlToken token("<Assertion ID=\"_presented\" " + attributes + "/>");
  token.id = "_presented";
  return token;
}

constexpr char kUtility[] =
    " xmlns:u=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-wssecurity-utility-1.0.xsd\"";

// The ids of the signed elements are new for each request.
TEST(RequestSigningTokenTest, IdsInTokensDoNotAffectWhatIsSigned) {
  for (const std::string& attributes :
       {std::string("u:Id=\"Body\"") + kUtility, std::string("id=\"Timestamp\"")}) {
    SoapRequest request;
    BuilderWithKey().BuildAcquireTokenByTokenRequest(TokenWith(attributes), SpecOf(60), request);
    const auto verdict = DevSts::VerifyXml(request.body, Credential().certificatePem);
    EXPECT_TRUE(verdict.valid) << attributes << ": " << verdict.reason;
  }
}

// The service decides whether it accepts one assertion twice. The oracle is one that does not, only
// because of the id.
TEST(RequestSigningTokenTest, TheActAsTokenMayBeThePresentedToken) {
  const FakeSamlToken token = TokenWith("");
  auto spec = SpecOf(60);
  spec.actAsToken = std::make_shared<FakeSamlToken>(token);
  SoapRequest request;
  BuilderWithKey().BuildAcquireTokenByTokenRequest(token, spec, request);
  EXPECT_THAT(HeaderOf(request.body), testing::ElementsAre(kTimestamp, kAssertion, kSignature));
  EXPECT_THAT(request.body, HasSubstr("<wst14:ActAs><Assertion ID=\"_presented\"/></wst14:ActAs>"));
  EXPECT_THAT(request.body, HasSubstr("#SAMLID\">_presented</wsse:KeyIdentifier>"));
  EXPECT_EQ(DevSts::VerifyXml(request.body, Credential().certificatePem).reason,
            "two elements have the id _presented");
  spec.actAsToken = std::make_shared<FakeSamlToken>("<Assertion ID=\"_other\"/>");
  BuilderWithKey().BuildAcquireTokenByTokenRequest(token, spec, request);
  const auto verdict = DevSts::VerifyXml(request.body, Credential().certificatePem);
  EXPECT_TRUE(verdict.valid) << verdict.reason;
}

TEST(RequestSigningTokenTest, TokensMayNotContainTheIdsOfTheRequest) {
  for (const std::string& id :
       {std::string("holderOfKeyProofSignature"), std::string("holderOfKeyCertificate")}) {
    for (const std::string& attributes :
         {"u:Id=\"" + id + "\"" + kUtility, "Id=\"" + id + "\"", "xml:id=\"" + id + "\"",
          "iD=\"" + id + "\"", "Id=\" " + id + "&#10;\""}) {
      auto spec = SpecOf(60);
      spec.actAsToken = std::make_shared<FakeSamlToken>(TokenWith(attributes));
      SoapRequest request;
      EXPECT_EQ(ThrownMessage<InvalidArgumentException>(
                    [&] { ByCertificate(BuilderWithKey(), spec, request); }),
                "A token in the request carries the id '" + id + "', which is the request's own");
      EXPECT_EQ(request.body, "");
    }
  }
}

TEST(RequestSigningDelegationTest, ARequestForADelegatedTokenHasNoUseKey) {
  auto spec = SpecOf(60);
  spec.delegateTo = "bob";
  SoapRequest request;
  ByCertificate(BuilderWithKey(), spec, request);
  EXPECT_THAT(HeaderOf(request.body), testing::ElementsAre(kTimestamp, kCertificate, kSignature));
  EXPECT_THAT(request.body, HasSubstr("/PublicKey</wst:KeyType>"));
  EXPECT_THAT(request.body, Not(HasSubstr("UseKey")));
}

TEST(RequestSigningCertificateTest, NoRequestCarriesAnExpiredCertificate) {
  const RequestBuilderImpl builder(ConfigOf(KeyCredential(DevSts::KeyType::Rsa2048, -2h, -1h)));
  for (const BuildOperation& operation : {BuildOperation(ByPassword), BuildOperation(InitialLeg),
                                          BuildOperation(ByCertificate), BuildOperation(Renew)}) {
    SoapRequest request;
    EXPECT_THAT(
        ThrownMessage<InvalidStateException>([&] { operation(builder, SpecOf(60), request); }),
        testing::StartsWith("The holder-of-key certificate of `CN=holder' expired at "));
    EXPECT_EQ(request.body, "");
  }
  SoapRequest request;
  ByPassword(builder, SpecOf(60, CONFIRMATION_BEARER), request);
  EXPECT_NE(request.body, "");
}

TEST(RequestSigningCertificateTest, ARequestByTokenIsSignedAfterTheCertificateHasExpired) {
  const RequestBuilderImpl builder(ConfigOf(KeyCredential(DevSts::KeyType::Rsa2048, -2h, -1h)));
  SoapRequest request;
  ByToken(builder, SpecOf(60), request);
  EXPECT_THAT(request.body, HasSubstr("holderOfKeyProofSignature"));
  EXPECT_THAT(request.body, Not(HasSubstr("BinarySecurityToken")));
}

TEST(RequestSigningLayoutTest, OperationsKeepTheirSlotOrder) {
  const auto builder = BuilderWithKey();
  const RequestBuilder& object = builder;
  SoapRequest request;
  using Leg = std::vector<unsigned char>;
  using Initial = void(const void*, const TokenSpec&, const Leg&, SoapRequest&);
  VtableSlot<Initial>(&object, 1)(&object, SpecOf(60), {1}, request);
  EXPECT_THAT(request.body, HasSubstr(" Context=\"urn:uuid:"));
  using Continued = void(const void*, const std::string&, const Leg&, SoapRequest&);
  VtableSlot<Continued>(&object, 2)(&object, "c", {1}, request);
  EXPECT_THAT(request.body, HasSubstr(" Context=\"c\""));
  using BySpec = void(const void*, const TokenSpec&, SoapRequest&);
  VtableSlot<BySpec>(&object, 3)(&object, SpecOf(60), request);
  EXPECT_THAT(HeaderOf(request.body), testing::ElementsAre(kTimestamp, kCertificate, kSignature));
  using ByTokenAndSpec = void(const void*, const SamlToken&, const TokenSpec&, SoapRequest&);
  VtableSlot<ByTokenAndSpec>(&object, 4)(&object, PresentedToken(), SpecOf(60), request);
  EXPECT_THAT(HeaderOf(request.body), testing::ElementsAre(kTimestamp, kAssertion, kSignature));
  using Validating = void(const void*, const SamlToken&, SoapRequest&);
  VtableSlot<Validating>(&object, 5)(&object, PresentedToken(), request);
  EXPECT_EQ(request.action, kValidateAction);
  using Renewing = void(const void*, const SamlToken&, std::int64_t, SoapRequest&);
  VtableSlot<Renewing>(&object, 6)(&object, PresentedToken(), 60, request);
  EXPECT_EQ(request.action, kRenewAction);
}

}  // namespace
}  // namespace SsoClient::Testing
