// Signed requests as the service receives them, verified by another implementation of XML
// signatures.
#include <memory>
#include <set>
#include <string>
#include <string_view>
#include <tuple>
#include <vector>

#include <gmock/gmock.h>

#include <devsts/xml_security.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"
#include "integration/text_edits.h"
#include "integration/wire_request.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::StartsWith;

/// Where a text is in a signed request.
enum class Place { UserName, Password, Audience, AdviceSource, AdviceName, AdviceValue, Delegate };

struct TextCase {
  const char* name;
  std::string text;
};

struct PlaceCase {
  const char* name;
  Place place;
};

class SignedTextTest : public HolderOfKeyTest,
                       public testing::WithParamInterface<std::tuple<PlaceCase, TextCase>> {};

Arguments ArgumentsWith(Place place, const std::string& text) {
  Arguments arguments;
  switch (place) {
    case Place::UserName:
      arguments.userName = text + "@EXAMPLE.COM";
      break;
    case Place::Password:
      arguments.password = text;
      break;
    case Place::Audience:
      arguments.spec.audienceRestriction = {text, "https://a.example"};
      break;
    case Place::AdviceSource:
      arguments.spec.advice = {{text, {}}};
      break;
    case Place::AdviceName:
      arguments.spec.advice = {{"urn:source", {{text, {}}}}};
      break;
    case Place::AdviceValue:
      arguments.spec.advice = {{"urn:source", {{"urn:name", {"", text}}}}};
      break;
    case Place::Delegate:
      arguments.spec.delegateTo = text + "@EXAMPLE.COM";
      break;
  }
  return arguments;
}

/// The text in the issued token, or the original one if the token does not contain it.
std::string TextOf(Place place, const SamlToken& token, const Arguments& arguments) {
  std::set<std::string> audiences;
  token.GetAudiences(audiences);
  std::vector<Advice> advice;
  token.GetAdvice(advice);
  switch (place) {
    case Place::UserName:
      return token.Subject().name;
    case Place::Password:
      return arguments.password;  // the service has compared it
    case Place::Audience:
      audiences.erase("https://a.example");
      return *audiences.begin();
    case Place::AdviceSource:
      return advice.at(0).source;
    case Place::AdviceName:
      return advice.at(0).attributes.at(0).name;
    case Place::AdviceValue:
      return advice.at(0).attributes.at(0).values.at(1);
    case Place::Delegate:
      return ChainOf(token).at(0);
  }
  return {};
}

// The request's own signature is the first in its envelope, unless there is an assertion in the
// header.
void ExpectVerifies(const std::string& body) {
  const DevSts::VerifyResult result = DevSts::VerifyXml(body, Holder().certificatePem);
  EXPECT_TRUE(result) << result.reason;
  EXPECT_THAT(result.referenceUris, ElementsAre(StartsWith("#Body"), StartsWith("#Timestamp")));
  EXPECT_FALSE(DevSts::VerifyXml(body, Stranger().certificatePem));
}

std::string Changed(std::string text, std::string_view what, std::string_view by) {
  Replace(text, what, by);
  return text;
}

TEST_P(SignedTextTest, ArrivesUnchangedInARequestWhoseSignatureVerifies) {
  const Place place = std::get<0>(GetParam()).place;
  const std::string& text = std::get<1>(GetParam()).text;
  const Arguments arguments = ArgumentsWith(place, text);
  DevSts::Users users;
  users[arguments.userName].password = arguments.password;
  Sts().SetUsers(users);

  const auto token =
      HolderService()->AcquireToken(arguments.userName, arguments.password, arguments.spec);
  EXPECT_TRUE(IsBoundTo(*token, Holder()));
  EXPECT_TRUE(TextOf(place, *token, arguments) == text);
  const std::string body = Sts().LastRequest().body;
  ExpectVerifies(body);
  EXPECT_FALSE(DevSts::VerifyXml(Changed(body, "</wsu:Expires>", "0</wsu:Expires>"),
                                 Holder().certificatePem));
  EXPECT_FALSE(
      DevSts::VerifyXml(Changed(body, ">false</wst:Delegatable>", ">true</wst:Delegatable>"),
                        Holder().certificatePem));
}

std::vector<TextCase> Texts() {
  std::string longText = "\r\n<&>\xC3\xA4";
  while (longText.size() < 100 * 1024) {
    longText += "a long text & more of it ]]> ";
  }
  return {{"Markup", "a<b>&amp;&#13;\"'</saml2:Assertion><!-- x -->"},
          {"LineEnds", "a\r\nb\rc\nd\te  f"},
          {"BlanksAround", " \t\r\na\n "},
          {"Foreign", "J\xC3\xBCrgen \xE2\x82\xAC \xF0\x9F\x94\x91 \xE4\xB8\xAD"},
          {"CDataEnd", "a]]>b]]&gt;<![CDATA[c]]>"},
          {"Long", longText}};
}

INSTANTIATE_TEST_SUITE_P(
    EveryPlace, SignedTextTest,
    testing::Combine(testing::Values(PlaceCase{"UserName", Place::UserName},
                                     PlaceCase{"Password", Place::Password},
                                     PlaceCase{"Audience", Place::Audience},
                                     PlaceCase{"AdviceSource", Place::AdviceSource},
                                     PlaceCase{"AdviceName", Place::AdviceName},
                                     PlaceCase{"AdviceValue", Place::AdviceValue},
                                     PlaceCase{"Delegate", Place::Delegate}),
                     testing::ValuesIn(Texts())),
    [](const auto& tested) {
      return std::string(std::get<0>(tested.param).name) + std::get<1>(tested.param).name;
    });

/// Requests that contain an assertion: as the act-as token, as the presented token, or as the
/// target.
class TravellingTokenTest : public HolderOfKeyTest, public testing::WithParamInterface<TextCase> {
 protected:
  /// Expects that the assertion's signature is still valid when the assertion is extracted from the
  /// last request.
  static void ExpectIntact(const SamlToken& token) {
    const std::string sent = AssertionIn(Sts().LastRequest().body);
    const std::string signer = Sts().SigningCertificatePem();
    const DevSts::VerifyResult result = DevSts::VerifyXml(sent, signer);
    EXPECT_TRUE(result) << result.reason;
    EXPECT_THAT(result.referenceUris, ElementsAre("#" + token.Id()));
    EXPECT_FALSE(DevSts::VerifyXml(Changed(sent, "Version=\"2.0\"", "Version=\"2.1\""), signer));

    const auto again = CreateSamlToken(sent, TrustSigner(signer).get());
    EXPECT_EQ(again->Id(), token.Id());
    EXPECT_EQ(again->Subject(), token.Subject());
    std::vector<Advice> advice;
    again->GetAdvice(advice);
    EXPECT_TRUE(advice.at(0).source == GetParam().text);
    EXPECT_TRUE(advice.at(0).attributes.at(0).values.at(0) == GetParam().text);
  }
  static TokenSpec SpecWithAdvice() {
    TokenSpec spec = RenewableAndDelegable();
    spec.advice = {{GetParam().text, {{"urn:name", {GetParam().text}}}}};
    return spec;
  }
  static std::shared_ptr<const SamlToken> BearerWithAdvice() {
    TokenSpec spec = SpecWithAdvice();
    spec.confirmation = CONFIRMATION_BEARER;
    return Acquire(spec);
  }
};

TEST_P(TravellingTokenTest, IsTheActAsTokenOfARequestSignedByCertificate) {
  TokenSpec spec = TenMinutes();
  spec.actAsToken = BearerWithAdvice();
  HolderService()->AcquireTokenByCertificate(spec);
  ExpectVerifies(Sts().LastRequest().body);
  ExpectIntact(**spec.actAsToken);
}

TEST_P(TravellingTokenTest, IsPresentedInTheHeader) {
  const auto token = AcquireBound(SpecWithAdvice());
  HolderService()->AcquireTokenByToken(*token, TenMinutes());
  EXPECT_EQ(Sts().LastRequest().signature, DevSts::RequestSignature::ByToken);
  ExpectIntact(*token);
}

TEST_P(TravellingTokenTest, IsRenewed) {
  const auto token = AcquireBound(SpecWithAdvice());
  const auto renewed = HolderService()->RenewToken(*token, 60);
  ExpectVerifies(Sts().LastRequest().body);
  ExpectIntact(*token);
  std::vector<Advice> advice;
  renewed->GetAdvice(advice);
  EXPECT_TRUE(advice.at(0).source == GetParam().text);
}

TEST_P(TravellingTokenTest, IsValidated) {
  for (const auto& token : {AcquireBound(SpecWithAdvice()), BearerWithAdvice()}) {
    EXPECT_TRUE(HolderService()->ValidateSubject(*token));
    ExpectIntact(*token);
  }
}

// There are two assertions in the request: the presented one proves the key, and the other one
// names the subject to act for.
TEST_P(TravellingTokenTest, IsPresentedTogetherWithAnActAsToken) {
  const auto token = AcquireBound(SpecWithAdvice());
  TokenSpec spec = TenMinutes();
  spec.actAsToken = BearerWithAdvice();
  EXPECT_NE(HolderService()->AcquireTokenByToken(*token, spec), nullptr);
  ExpectIntact(*token);
  const std::string body = Sts().LastRequest().body;
  const std::string actAs = AssertionIn(body.substr(body.find("<wst14:ActAs>")));
  EXPECT_TRUE(DevSts::VerifyXml(actAs, Sts().SigningCertificatePem()));
  EXPECT_EQ(CreateSamlToken(actAs, TrustSigner(Sts().SigningCertificatePem()).get())->Id(),
            (*spec.actAsToken)->Id());
}

INSTANTIATE_TEST_SUITE_P(Texts, TravellingTokenTest, testing::ValuesIn(Texts()),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
