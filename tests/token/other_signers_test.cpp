#include <memory>
#include <string>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/assertion_text.h"
#include "support/test_data.h"

// Tokens that were signed by other implementations: see tarnik/tests/data/other_signers/README.md.
namespace SsoClient::Testing {
namespace {

std::string ReadSample(const std::string& file) {
  return Tarnik::Testing::ReadTestData("other_signers/" + file);
}

std::shared_ptr<const SamlToken> Check(const std::string& text, const std::string& signer) {
  const auto resolver = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::CreateCertificatesFromPem(ReadSample(signer + ".pem")));
  return CreateSamlToken(text, resolver.get());
}

struct Sample {
  const char* file;
  const char* surname = "Byron";
  const char* signer = "rsa";
};

class TokenOfOtherSignersTest : public testing::TestWithParam<Sample> {};

TEST_P(TokenOfOtherSignersTest, IsAccepted) {
  const auto token = Check(ReadSample(GetParam().file), GetParam().signer);
  EXPECT_EQ(token->Subject().name, "ada");
  EXPECT_EQ(token->Subject().domain, "example");
  EXPECT_EQ(token->ExpirationTime().ToString(), "2126-01-01T00:00:00.000Z");
  SubjectNames names;
  token->GetSubjectNames(names);
  EXPECT_EQ(names.givenName, "Ada");
  EXPECT_EQ(names.surname, GetParam().surname);
}

// Control: what the token must not lose for it.
TEST_P(TokenOfOtherSignersTest, IsRefusedWithAnotherValue) {
  const std::string text = Replaced(ReadSample(GetParam().file), ">Ada<", ">Eve<");
  EXPECT_NO_THROW(CreateSamlToken(text));
  EXPECT_THROW(Check(text, GetParam().signer), InvalidSignatureException);
}

INSTANTIATE_TEST_SUITE_P(
    Files, TokenOfOtherSignersTest,
    testing::Values(Sample{"jdk-empty-value.xml", ""}, Sample{"jdk-p521.xml", "Byron", "p521"},
                    Sample{"jdk-undeclared-type-prefix.xml"},
                    Sample{"santuario-p521-short.xml", "Byron", "p521"},
                    Sample{"santuario-p521.xml", "Byron", "p521"},
                    Sample{"santuario-prefix-list.xml"}, Sample{"xml-crypto-empty-value.xml", ""},
                    Sample{"xml-crypto-prefix-list.xml"},
                    Sample{"xml-crypto-undeclared-type-prefix.xml"},
                    Sample{"xmlsec1-empty-value.xml", ""},
                    Sample{"xmlsec1-p521.xml", "Byron", "p521"}, Sample{"xmlsec1-prefix-list.xml"},
                    Sample{"xmlsec1-undeclared-type-prefix.xml"}),
    [](const auto& tested) {
      std::string name;
      for (const char c : std::string(tested.param.file)) {
        name.push_back(c == '-' || c == '.' ? '_' : c);
      }
      return name;
    });

}  // namespace
}  // namespace SsoClient::Testing
