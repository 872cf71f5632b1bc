#include <devsts/xml_security.h>
#include <gmock/gmock.h>
#include <tarnik/core/exception.h>
#include <tarnik/xml/xml_parse_exception.h>

#include <chrono>
#include <functional>
#include <regex>
#include <string>

#include "sts/request_builder.h"
#include "support/fake_saml_token.h"
#include "support/holder_of_key.h"
#include "support/parse_xml.h"
#include "support/thrown_message.h"
#include "support/vtable_slot.h"
#include "xml/built_xml.h"
#include "xml/request_bodies.h"

namespace SsoClient {
namespace {

using namespace std::chrono_literals;
using Tarnik::InvalidArgumentException;
using Tarnik::InvalidStateException;
using testing::HasSubstr;
using testing::Not;
using TestSupport::ThrownMessage;

constexpr char kIssueAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Issue";
constexpr char kRenewAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Renew";
constexpr char kValidateAction[] = "http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate";

constexpr char kTimestamp[] = "wsu:Timestamp";
constexpr char kUsername[] = "wsse:UsernameToken";
constexpr char kCertificate[] = "wsse:BinarySecurityToken";
constexpr char kAssertion[] = "Assertion";
constexpr char kSignature[] = "ds:Signature";

const DevSts::Credential& Credential() {
  static const DevSts::Credential credential = Testing::KeyCredential();
  return credential;
}

RequestBuilderImpl BuilderWithKey() {
  return RequestBuilderImpl(Testing::ConfigOf(Credential()));
}

Testing::FakeSamlToken PresentedToken(TokenConfirmationType confirmation = HOLDER_OF_KEY) {
  Testing::FakeSamlToken token("<Assertion ID=\"_presented\"/>");
  token.id = "_presented";
  token.confirmationType = confirmation;
  return token;
}

TokenSpec SpecOf(std::int64_t seconds, ConfirmationType confirmation = CONFIRMATION_DEFAULT,
                 bool isActingAs = false) {
  TokenSpec spec;
  spec.tokenLifetimeSec = seconds;
  spec.confirmation = confirmation;
  if (isActingAs) {
    spec.actAsToken = std::make_shared<Testing::FakeSamlToken>("<ActsAs ID=\"_other\"/>");
  }
  return spec;
}

using Operation = std::function<void(const RequestBuilderImpl&, const TokenSpec&, SoapRequest&)>;

void ByPassword(const RequestBuilderImpl& builder, const TokenSpec& spec, SoapRequest& request) {
  builder.BuildAcquireTokenRequest("alice", "pw", spec, request);
}
void InitialLeg(const RequestBuilderImpl& builder, const TokenSpec& spec, SoapRequest& request) {
  builder.BuildInitialNegotiationRequest(spec, {1}, request);
}
void ContinuedLeg(const RequestBuilderImpl& builder, const TokenSpec&, SoapRequest& request) {
  builder.BuildContinuedNegotiationRequest("c", {1}, request);
}
void ByCertificate(const RequestBuilderImpl& builder, const TokenSpec& spec, SoapRequest& request) {
  builder.BuildAcquireTokenByCertificateRequest(spec, request);
}
void ByToken(const RequestBuilderImpl& builder, const TokenSpec& spec, SoapRequest& request) {
  builder.BuildAcquireTokenByTokenRequest(PresentedToken(), spec, request);
}
void Validate(const RequestBuilderImpl& builder, const TokenSpec&, SoapRequest& request) {
  builder.BuildValidateRequest(PresentedToken(), request);
}
void Renew(const RequestBuilderImpl& builder, const TokenSpec& spec, SoapRequest& request) {
  builder.BuildRenewRequest(PresentedToken(), spec.tokenLifetimeSec, request);
}

std::vector<std::string> HeaderOf(const std::string& envelope) {
  const auto document = Testing::ParseXml(envelope);
  const auto* security =
      document->RootElement()->FirstChildElement("Header")->FirstChildElement("Security");
  std::vector<std::string> names;
  for (auto* node = security->FirstChild(); node != nullptr; node = node->NextSibling()) {
    names.emplace_back(static_cast<const Tarnik::Xml::ElementNode*>(node)->QualifiedNameText());
  }
  return names;
}

const std::vector<Operation>& AllOperations() {
  static const std::vector<Operation> operations{
      ByPassword, InitialLeg, ContinuedLeg, ByCertificate, ByToken, Validate, Renew};
  return operations;
}

// What a request is to be; an error message instead of a header when it is refused.
struct SigningCase {
  const char* name;
  Operation operation;
  bool hasKey;
  ConfirmationType confirmation;
  bool isActingAs;
  std::vector<std::string> header;
  const char* keyType;  // null: none in the body
  bool hasUseKey;
  const char* refusal = nullptr;
};

constexpr char kPublicKey[] = "PublicKey";
constexpr char kBearer[] = "Bearer";
constexpr char kNoKeyForCertificate[] =
    "No HolderOfKeyConfig provided. Unable to acquire token by certificate";
constexpr char kNoKeyForToken[] = "No HolderOfKeyConfig provided. Unable to acquire token by token";
constexpr char kNoKeyForRenewal[] = "No HolderOfKeyConfig provided. Unable to renew token";
constexpr char kNotDefault[] =
    "TokenSpec::confirmation must be CONFIRMATION_DEFAULT for acquire token by certificate";
constexpr auto kDefault = CONFIRMATION_DEFAULT;
constexpr auto kOther = CONFIRMATION_BEARER;
constexpr auto kUnnamed = static_cast<ConfirmationType>(-1);  // anything but zero means bearer

const std::vector<std::string> kPlainPassword{kTimestamp, kUsername};
const std::vector<std::string> kSignedPassword{kTimestamp, kUsername, kCertificate, kSignature};
const std::vector<std::string> kByCertificate{kTimestamp, kCertificate, kSignature};
const std::vector<std::string> kByToken{kTimestamp, kAssertion, kSignature};
const std::vector<std::string> kPlain{kTimestamp};

class RequestSigningTest : public testing::TestWithParam<SigningCase> {};

std::string Refusal(const SigningCase& tested, const RequestBuilderImpl& builder,
                    const TokenSpec& spec) {
  SoapRequest request;
  const auto message =
      tested.hasKey
          ? ThrownMessage<InvalidArgumentException>(
                [&] { tested.operation(builder, spec, request); })
          : ThrownMessage<InvalidStateException>([&] { tested.operation(builder, spec, request); });
  EXPECT_EQ(request.body, "");
  EXPECT_EQ(request.action, "");
  return message;
}

TEST_P(RequestSigningTest, IsDecidedByKeyConfirmationActAsTokenAndOperation) {
  const auto& tested = GetParam();
  const auto builder = tested.hasKey ? BuilderWithKey() : RequestBuilderImpl(boost::none);
  const auto spec = SpecOf(60, tested.confirmation, tested.isActingAs);
  if (tested.refusal != nullptr) {
    EXPECT_EQ(Refusal(tested, builder, spec), tested.refusal);
    return;
  }
  SoapRequest request;
  tested.operation(builder, spec, request);
  EXPECT_EQ(HeaderOf(request.body), tested.header);
  const std::string keyType = tested.keyType == nullptr
                                  ? "wst:KeyType"
                                  : std::string("/") + tested.keyType + "</wst:KeyType>";
  EXPECT_EQ(request.body.find(keyType) != std::string::npos, tested.keyType != nullptr);
  EXPECT_EQ(
      request.body.find("<wst:UseKey Sig=\"holderOfKeyProofSignature\"/>") != std::string::npos,
      tested.hasUseKey);
  if (tested.header.back() == kSignature) {
    const auto verdict = DevSts::VerifyXml(request.body, Credential().certificatePem);
    EXPECT_TRUE(verdict.valid) << verdict.reason;
  }
}

INSTANTIATE_TEST_SUITE_P(
    Requests, RequestSigningTest,
    testing::Values(
        SigningCase{"PasswordNoKey", ByPassword, false, kDefault, false, kPlainPassword, kBearer,
                    false},
        SigningCase{"PasswordNoKeyBearer", ByPassword, false, kOther, false, kPlainPassword,
                    kBearer, false},
        SigningCase{"PasswordNoKeyActAs", ByPassword, false, kDefault, true, kPlainPassword,
                    kBearer, false},
        SigningCase{"PasswordNoKeyBearerActAs", ByPassword, false, kOther, true, kPlainPassword,
                    kBearer, false},
        SigningCase{"Password", ByPassword, true, kDefault, false, kSignedPassword, kPublicKey,
                    true},
        SigningCase{"PasswordBearer", ByPassword, true, kOther, false, kPlainPassword, kBearer,
                    false},
        SigningCase{"PasswordOfAnotherConfirmation", ByPassword, true, kUnnamed, false,
                    kPlainPassword, kBearer, false},
        SigningCase{"PasswordActAs", ByPassword, true, kDefault, true, kPlainPassword, kPublicKey,
                    true},
        SigningCase{"PasswordBearerActAs", ByPassword, true, kOther, true, kPlainPassword, kBearer,
                    false},
        SigningCase{"InitialLegNoKey", InitialLeg, false, kDefault, false, kPlain, kBearer, false},
        SigningCase{"InitialLegNoKeyActAs", InitialLeg, false, kDefault, true, kPlain, kBearer,
                    false},
        SigningCase{"InitialLeg", InitialLeg, true, kDefault, false, kByCertificate, kPublicKey,
                    true},
        SigningCase{"InitialLegBearer", InitialLeg, true, kOther, false, kPlain, kBearer, false},
        SigningCase{"InitialLegActAs", InitialLeg, true, kDefault, true, kPlain, kPublicKey, true},
        SigningCase{"ContinuedLegNoKey", ContinuedLeg, false, kDefault, false, kPlain, nullptr,
                    false},
        SigningCase{"ContinuedLeg", ContinuedLeg, true, kDefault, false, kPlain, nullptr, false},
        SigningCase{"CertificateNoKey",
                    ByCertificate,
                    false,
                    kDefault,
                    false,
                    {},
                    nullptr,
                    false,
                    kNoKeyForCertificate},
        SigningCase{"CertificateNoKeyBearer",
                    ByCertificate,
                    false,
                    kOther,
                    false,
                    {},
                    nullptr,
                    false,
                    kNoKeyForCertificate},
        SigningCase{"Certificate", ByCertificate, true, kDefault, false, kByCertificate, kPublicKey,
                    true},
        SigningCase{"CertificateActAs", ByCertificate, true, kDefault, true, kByCertificate,
                    kPublicKey, true},
        SigningCase{"CertificateBearer",
                    ByCertificate,
                    true,
                    kOther,
                    false,
                    {},
                    nullptr,
                    false,
                    kNotDefault},
        SigningCase{"CertificateBearerActAs",
                    ByCertificate,
                    true,
                    kOther,
                    true,
                    {},
                    nullptr,
                    false,
                    kNotDefault},
        SigningCase{
            "TokenNoKey", ByToken, false, kDefault, false, {}, nullptr, false, kNoKeyForToken},
        SigningCase{"Token", ByToken, true, kDefault, false, kByToken, kPublicKey, false},
        SigningCase{"TokenActAs", ByToken, true, kDefault, true, kByToken, kPublicKey, false},
        SigningCase{"TokenBearer", ByToken, true, kOther, false, kByToken, kBearer, false},
        SigningCase{"TokenBearerActAs", ByToken, true, kOther, true, kByToken, kBearer, false},
        SigningCase{"ValidateNoKey", Validate, false, kDefault, false, kPlain, nullptr, false},
        SigningCase{"Validate", Validate, true, kDefault, false, kPlain, nullptr, false},
        SigningCase{
            "RenewNoKey", Renew, false, kDefault, false, {}, nullptr, false, kNoKeyForRenewal},
        SigningCase{"Renew", Renew, true, kDefault, false, kByCertificate, nullptr, false}),
    [](const auto& tested) { return tested.param.name; });

TEST(RequestSigningActionTest, EachOperationHasItsAction) {
  const auto builder = BuilderWithKey();
  const auto action = [&](const Operation& operation) {
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
  const auto document = Testing::ParseXml(envelope);
  const auto body =
      Testing::XmlText(document->RootElement()->FirstChildElement("Body")->FirstChild());
  return WithoutContext(Testing::WithoutTimes(body));
}

TEST(RequestSigningBodyTest, IsThatOfTheOperation) {
  const auto expected = [](const XMLBaseBuilder& builder) {
    return WithoutContext(Testing::WithoutTimes(Testing::BuiltXml(builder)));
  };
  const auto token = PresentedToken();
  const auto builder = BuilderWithKey();
  const auto body = [&](const Operation& operation, const TokenSpec& spec) {
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
  return Testing::TimeAt(envelope, {part, container, element, "Expires"}).GetUtcTime() -
         Testing::TimeAt(envelope, {part, container, element, "Created"}).GetUtcTime();
}

TEST(RequestSigningTimesTest, EveryTimestampIsValidForTenMinutes) {
  for (const Operation& operation : AllOperations()) {
    SoapRequest request;
    operation(BuilderWithKey(), SpecOf(60), request);
    const auto document = Testing::ParseXml(request.body);
    EXPECT_EQ(Microseconds(*document->RootElement(), "Header", "Security", "Timestamp"),
              600'000'000);
  }
}

TEST(RequestSigningTimesTest, TheLifetimeAskedForIsThatOfTheSpecOrTheRenewal) {
  for (const Operation& operation :
       {Operation(ByPassword), Operation(InitialLeg), Operation(ByCertificate), Operation(ByToken),
        Operation(Renew)}) {
    for (const std::int64_t seconds : {1, 77}) {
      SoapRequest request;
      operation(BuilderWithKey(), SpecOf(seconds), request);
      const auto document = Testing::ParseXml(request.body);
      EXPECT_EQ(Microseconds(*document->RootElement(), "Body", "RequestSecurityToken", "Lifetime"),
                seconds * 1'000'000);
    }
  }
}

TEST(RequestSigningOrderTest, TheLifetimeIsJudgedFirst) {
  for (const bool hasKey : {false, true}) {
    const auto builder = hasKey ? BuilderWithKey() : RequestBuilderImpl(boost::none);
    for (const Operation& operation :
         {Operation(ByPassword), Operation(InitialLeg), Operation(ByCertificate),
          Operation(ByToken), Operation(Renew)}) {
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

TEST(RequestSigningTokenTest, AMalformedTokenTextLeavesTheRequestAsItWas) {
  const Testing::FakeSamlToken broken("<A>");
  SoapRequest request;
  EXPECT_THROW(BuilderWithKey().BuildValidateRequest(broken, request),
               Tarnik::Xml::XMLParseException);
  EXPECT_THROW(BuilderWithKey().BuildAcquireTokenByTokenRequest(broken, SpecOf(60), request),
               Tarnik::Xml::XMLParseException);
  EXPECT_EQ(request.body, "");
}

Testing::FakeSamlToken TokenWith(const std::string& attributes) {
  Testing::FakeSamlToken token("<Assertion ID=\"_presented\" " + attributes + "/>");
  token.id = "_presented";
  return token;
}

constexpr char kUtility[] =
    " xmlns:u=\"http://docs.oasis-open.org/wss/2004/01/"
    "oasis-200401-wss-wssecurity-utility-1.0.xsd\"";

// The ids of what is signed are drawn anew for each request.
TEST(RequestSigningTokenTest, IdsInsideOfTokensDoNotDivertTheSignature) {
  for (const std::string& attributes :
       {std::string("u:Id=\"Body\"") + kUtility, std::string("id=\"Timestamp\"")}) {
    SoapRequest request;
    BuilderWithKey().BuildAcquireTokenByTokenRequest(TokenWith(attributes), SpecOf(60), request);
    const auto verdict = DevSts::VerifyXml(request.body, Credential().certificatePem);
    EXPECT_TRUE(verdict.valid) << attributes << ": " << verdict.reason;
  }
}

TEST(RequestSigningTokenTest, TokensMayNotCarryTheIdsOfTheRequestItself) {
  for (const std::string& id :
       {std::string("holderOfKeyProofSignature"), std::string("holderOfKeyCertificate")}) {
    for (const std::string& attributes :
         {"u:Id=\"" + id + "\"" + kUtility, "Id=\"" + id + "\"", "xml:id=\"" + id + "\""}) {
      auto spec = SpecOf(60);
      spec.actAsToken = std::make_shared<Testing::FakeSamlToken>(TokenWith(attributes));
      SoapRequest request;
      EXPECT_EQ(ThrownMessage<InvalidArgumentException>(
                    [&] { ByCertificate(BuilderWithKey(), spec, request); }),
                "A token in the request carries the id '" + id + "', which is the request's own");
      EXPECT_EQ(request.body, "");
    }
  }
}

TEST(RequestSigningDelegationTest, ADelegatedTokenIsSignedForWithoutUseKey) {
  auto spec = SpecOf(60);
  spec.delegateTo = "bob";
  SoapRequest request;
  ByCertificate(BuilderWithKey(), spec, request);
  EXPECT_THAT(HeaderOf(request.body), testing::ElementsAre(kTimestamp, kCertificate, kSignature));
  EXPECT_THAT(request.body, HasSubstr("/PublicKey</wst:KeyType>"));
  EXPECT_THAT(request.body, Not(HasSubstr("UseKey")));
}

TEST(RequestSigningCertificateTest, AnExpiredCertificateSignsNothing) {
  const RequestBuilderImpl builder(
      Testing::ConfigOf(Testing::KeyCredential(DevSts::KeyType::Rsa2048, -2h, -1h)));
  for (const Operation& operation :
       {Operation(ByPassword), Operation(InitialLeg), Operation(ByCertificate), Operation(ByToken),
        Operation(Renew)}) {
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

TEST(RequestSigningLayoutTest, OperationsStandInTheirOrder) {
  const auto builder = BuilderWithKey();
  const RequestBuilder& object = builder;
  SoapRequest request;
  using Leg = std::vector<unsigned char>;
  using Initial = void(const void*, const TokenSpec&, const Leg&, SoapRequest&);
  TestSupport::VtableSlot<Initial>(&object, 1)(&object, SpecOf(60), {1}, request);
  EXPECT_THAT(request.body, HasSubstr(" Context=\"urn:uuid:"));
  using Continued = void(const void*, const std::string&, const Leg&, SoapRequest&);
  TestSupport::VtableSlot<Continued>(&object, 2)(&object, "c", {1}, request);
  EXPECT_THAT(request.body, HasSubstr(" Context=\"c\""));
  using BySpec = void(const void*, const TokenSpec&, SoapRequest&);
  TestSupport::VtableSlot<BySpec>(&object, 3)(&object, SpecOf(60), request);
  EXPECT_THAT(HeaderOf(request.body), testing::ElementsAre(kTimestamp, kCertificate, kSignature));
  using ByTokenAndSpec = void(const void*, const SamlToken&, const TokenSpec&, SoapRequest&);
  TestSupport::VtableSlot<ByTokenAndSpec>(&object, 4)(&object, PresentedToken(), SpecOf(60),
                                                      request);
  EXPECT_THAT(HeaderOf(request.body), testing::ElementsAre(kTimestamp, kAssertion, kSignature));
  using Validating = void(const void*, const SamlToken&, SoapRequest&);
  TestSupport::VtableSlot<Validating>(&object, 5)(&object, PresentedToken(), request);
  EXPECT_EQ(request.action, kValidateAction);
  using Renewing = void(const void*, const SamlToken&, std::int64_t, SoapRequest&);
  TestSupport::VtableSlot<Renewing>(&object, 6)(&object, PresentedToken(), 60, request);
  EXPECT_EQ(request.action, kRenewAction);
}

}  // namespace
}  // namespace SsoClient
