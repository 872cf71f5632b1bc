#include <functional>
#include <string>
#include <utility>

#include <gmock/gmock.h>

#include "integration/sts_fixture.h"
#include "integration/text_edits.h"

namespace SsoClient::Testing {
namespace {

using testing::HasSubstr;

constexpr char kTampered[] = "Failed to verify signature: token might have been tampered with.";

class TokenTrustTest : public StsTest {
 protected:
  static void AfterSigning(std::function<void(std::string&)> edit) {
    DevSts::AssertionOptions options;
    options.afterSigning = std::move(edit);
    Sts().SetAssertionOptions(options);
  }
};

TEST_F(TokenTrustTest, AlteredSubjectIsRefused) {
  AfterSigning([](std::string& xml) { Replace(xml, ">alice@", ">admin@"); });
  EXPECT_EQ(MessageOf<InvalidSignatureException>([] { Acquire(); }), kTampered);
}

TEST_F(TokenTrustTest, AlteredIssuerIsRefused) {
  AfterSigning([](std::string& xml) { Replace(xml, "sts.example.com", "sts.example.org"); });
  EXPECT_EQ(MessageOf<InvalidSignatureException>([] { Acquire(); }), kTampered);
}

TEST_F(TokenTrustTest, RemovedSignatureIsRefused) {
  AfterSigning(EraseSignature);
  EXPECT_THROW(Acquire(), ParseException);
}

TEST_F(TokenTrustTest, StrangersSignatureIsRefused) {
  const auto stranger = Sts().StrangerCredential();
  AfterSigning([stranger](std::string& xml) {
    EraseSignature(xml);
    xml = DevSts::SignXml(xml, stranger.privateKeyPem, stranger.certificatePem,
                          DevSts::AssertionOptions::DefaultSigning());
  });
  EXPECT_THAT(MessageOf<InvalidSignatureException>([] { Acquire(); }),
              HasSubstr("Signature verification error. "));
}

TEST_F(TokenTrustTest, StrangersSignatureWithoutKeyInfoIsRefused) {
  const auto stranger = Sts().StrangerCredential();
  AfterSigning([stranger](std::string& xml) {
    EraseSignature(xml);
    auto signing = DevSts::AssertionOptions::DefaultSigning();
    signing.keyInfo = DevSts::KeyInfoContent::None;
    xml = DevSts::SignXml(xml, stranger.privateKeyPem, stranger.certificatePem, signing);
  });
  EXPECT_EQ(MessageOf<InvalidSignatureException>([] { Acquire(); }), kTampered);
}

TEST_F(TokenTrustTest, FactoryWithoutAResolverAcceptsAnySignature) {
  AfterSigning([](std::string& xml) { Replace(xml, ">alice@", ">admin@"); });
  SecurityTokenServiceConfig config;
  const auto sslContext = TrustCa(Sts());
  config.url = Sts().HttpsUrl();
  config.sslContext = sslContext.get();
  config.tokenFactory = CreateSamlTokenFactory(nullptr);
  const auto token =
      CreateSecurityTokenService(config)->AcquireToken(kUser, kPassword, TenMinutes());
  EXPECT_EQ(token->Subject().name, "admin");
}

TEST_F(TokenTrustTest, TokenKeepsTheServicesTextAndVerifiesElsewhere) {
  const auto token = Acquire();
  const auto verdict = DevSts::VerifyXml(token->Xml(), Sts().SigningCertificatePem());
  EXPECT_TRUE(verdict) << verdict.reason;
  const auto again =
      CreateSamlToken(token->Xml(), TrustSigner(Sts().SigningCertificatePem()).get());
  EXPECT_EQ(again->Id(), token->Id());
}

TEST_F(TokenTrustTest, ResolverMayBeChosenByTheTokensIssuer) {
  const auto token = Acquire();
  const auto trusted = TrustSigner(Sts().SigningCertificatePem());
  const auto chosen = CreateSamlToken(token->Xml(), [&](const SamlToken* parsed) {
    EXPECT_EQ(parsed->Issuer(), "https://sts.example.com/STS");
    return trusted;
  });
  EXPECT_EQ(chosen->Id(), token->Id());
  const auto stranger = TrustSigner(Sts().StrangerCredential().certificatePem);
  EXPECT_THROW(CreateSamlToken(token->Xml(), [&](const SamlToken*) { return stranger; }),
               InvalidSignatureException);
}

TEST_F(TokenTrustTest, ExpiredAnswerIsRefusedWithItsTime) {
  DevSts::AssertionOptions options;
  options.beforeSigning = [](std::string& xml) {
    for (const std::string& name : {std::string("NotBefore=\""), std::string("NotOnOrAfter=\"")}) {
      for (auto at = xml.find(name); at != std::string::npos; at = xml.find(name, at + 1)) {
        xml.replace(at + name.size(), 4, "2001");
      }
    }
  };
  Sts().SetAssertionOptions(options);
  EXPECT_THAT(MessageOf<ParseException>([] { Acquire(); }),
              HasSubstr("The token has expired at: "));
}

}  // namespace
}  // namespace SsoClient::Testing
