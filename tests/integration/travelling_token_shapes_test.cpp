// The signatures of assertions in unusual forms remain valid when the assertions are sent in
// requests.
#include <memory>
#include <string>
#include <utility>

#include <gtest/gtest.h>

#include <devsts/xml_security.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"
#include "integration/text_edits.h"
#include "integration/wire_request.h"
#include "support/parse_xml.h"

namespace SsoClient::Testing {
namespace {

struct Shape {
  const char* name;
  void (*change)(DevSts::AssertionOptions& options);
};

class TravellingTokenShapesTest : public HolderOfKeyTest,
                                  public testing::WithParamInterface<Shape> {
 protected:
  TravellingTokenShapesTest() {
    DevSts::AssertionOptions options;
    GetParam().change(options);
    Sts().SetAssertionOptions(options);
  }
};

TEST_P(TravellingTokenShapesTest, AreAcceptedByEveryOperationAndStillVerifySeparately) {
  Arguments arguments;
  TokenSpec spec = RenewableAndDelegable();
  spec.advice = {{"urn:source", {{"urn:name", {"<&>]]>\r\n\t", ""}}}}};
  arguments.token = AcquireBound(spec);
  arguments.spec.actAsToken = DelegableBearer();
  const auto service = HolderService();
  const std::string signer = Sts().SigningCertificatePem();
  for (const Operation operation :
       {Operation::Certificate, Operation::Token, Operation::Renew, Operation::Validate}) {
    SCOPED_TRACE(NameOf(operation));
    const Outcome outcome = CallNow(operation, *service, arguments);
    EXPECT_TRUE(outcome.IsSuccess()) << outcome.message;
    EXPECT_NE(outcome.verdict, false);
    const std::string sent = AssertionIn(Sts().LastRequest().body);
    const DevSts::VerifyResult result = DevSts::VerifyXml(sent, signer);
    EXPECT_TRUE(result) << result.reason;
    const auto& travelled =
        operation == Operation::Certificate ? *arguments.spec.actAsToken : arguments.token;
    EXPECT_EQ(CreateSamlToken(sent, TrustSigner(signer).get())->Id(), travelled->Id());
  }
}

using DevSts::AssertionOptions;

INSTANTIATE_TEST_SUITE_P(
    Shapes, TravellingTokenShapesTest,
    testing::Values(Shape{"Plain", [](AssertionOptions&) {}},
                    Shape{"InheritedNamespaces",
                          [](AssertionOptions& options) { options.inheritNamespaces = true; }},
                    Shape{"Indented", [](AssertionOptions& options) { options.indent = true; }},
                    Shape{"InheritedAndIndented",
                          [](AssertionOptions& options) {
                            options.inheritNamespaces = true;
                            options.indent = true;
                          }},
                    Shape{"WithoutKeyInfo",
                          [](AssertionOptions& options) {
                            options.signing.keyInfo = DevSts::KeyInfoContent::None;
                          }},
                    Shape{"KeyValue",
                          [](AssertionOptions& options) {
                            options.signing.keyInfo = DevSts::KeyInfoContent::KeyValue;
                          }},
                    Shape{"Sha512",
                          [](AssertionOptions& options) {
                            options.signing.signature = DevSts::SignatureAlgorithm::RsaSha512;
                            options.signing.digest = DevSts::DigestAlgorithm::Sha512;
                          }},
                    Shape{"Pss",
                          [](AssertionOptions& options) {
                            options.signing.signature = DevSts::SignatureAlgorithm::RsaPssSha256;
                          }},
                    Shape{"WithoutTypesAndFormat",
                          [](AssertionOptions& options) {
                            options.attributeValueTypes = false;
                            options.issuerFormat = false;
                          }}),
    [](const auto& tested) { return tested.param.name; });

/// Tokens that a caller does not use directly as received from the service.
class StoredTokenTest : public HolderOfKeyTest {
 protected:
  static void ExpectAccepted(std::shared_ptr<const SamlToken> token) {
    Arguments arguments;
    arguments.token = std::move(token);
    const auto service = HolderService();
    for (const Operation operation : {Operation::Token, Operation::Renew, Operation::Validate}) {
      const Outcome outcome = CallNow(operation, *service, arguments);
      EXPECT_TRUE(outcome.IsSuccess()) << operation << ": " << outcome.message;
      EXPECT_NE(outcome.verdict, false);
    }
  }
};

TEST_F(StoredTokenTest, IsAcceptedWithDeclarationByteOrderMarkAndComments) {
  const std::string xml = AcquireBound()->Xml();
  ExpectAccepted(CreateSamlToken("<?xml version=\"1.0\" encoding=\"UTF-8\"?>\n<!-- kept -->\n" +
                                 xml + "\n<!-- end -->\n"));
  ExpectAccepted(CreateSamlToken("\xEF\xBB\xBF" + xml));
}

TEST_F(StoredTokenTest, IsAcceptedWithEquivalentMarkup) {
  std::string xml = AcquireBound()->Xml();
  Replace(xml, ">alice@EXAMPLE.COM<", "><![CDATA[alice]]>&#64;EXAMPLE.COM<");
  Replace(xml, "Version=\"2.0\"", "Version='2.0'");
  Replace(xml, "<saml2:Subject>", "<saml2:Subject  >");
  ExpectAccepted(CreateSamlToken(xml));
}

TEST_F(StoredTokenTest, IsAcceptedFromAnotherDocument) {
  const std::string xml =
      "<a xmlns=\"urn:a\" xmlns:b=\"urn:b\"><b:c>" + AcquireBound()->Xml() + "</b:c></a>";
  const auto document = ParseXml(xml);
  auto* root = document->RootElement();
  const auto token =
      CreateSamlTokenFromDom(root->FirstChildElement("c")->FirstChildElement("Assertion"));
  EXPECT_NE(token->Xml().find("xmlns:b"), std::string::npos);
  ExpectAccepted(token);
}

}  // namespace
}  // namespace SsoClient::Testing
