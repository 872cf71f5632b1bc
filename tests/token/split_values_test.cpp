#include <string>

#include <gtest/gtest.h>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>

#include "support/assertion_text.h"
#include "support/thrown_message.h"
#include "support/token_edits.h"
#include "support/token_values.h"

// Values that are split by a node. A reader that uses only the first piece of text would read
// another name than the signed one.
namespace SsoClient::Testing {
namespace {

std::string UnsignedXml() {
  AssertionText text;
  text.Delegate();
  text.signature.clear();
  return text.ToXml();
}

std::string SignedXml(const std::string& xml) {
  const DevSts::Credential& signer = TrustedCredential();
  DevSts::SignOptions options;
  options.signature = DevSts::SignatureAlgorithm::EcdsaSha256;
  return DevSts::SignXml(xml, signer.privateKeyPem, signer.certificatePem, options);
}

class SplitValuesTest : public testing::TestWithParam<SplitValue> {
 protected:
  static void ExpectRefused(const std::string& xml) {
    const auto resolver = TrustedResolver();
    const std::string message =
        ThrownMessage<ParseException>([&] { CreateSamlToken(xml, resolver.get()); });
    EXPECT_TRUE(
        message.ends_with("' must only have textual content (but has extra children or is empty)."))
        << message;
    EXPECT_THROW(CreateSamlToken(xml), ParseException);
  }
};

// Not even the trusted signer may split values.
TEST_P(SplitValuesTest, AreRefusedEvenWhenSigned) {
  for (const char* node : {"<!---->", "<!--x-->", "<?p?>", "<?p x?>", "<x/>", "<x>y</x>"}) {
    const std::string xml = SignedXml(SplitBy(UnsignedXml(), GetParam(), node));
    ASSERT_TRUE(DevSts::VerifyXml(xml, TrustedCredential().certificatePem));
    ExpectRefused(xml);
  }
}

// A comment does not change the signature, since the canonical form has no comments.
TEST_P(SplitValuesTest, AreRefusedWhenSplitByACommentAfterwards) {
  const std::string xml = SplitBy(SignedXml(UnsignedXml()), GetParam(), "<!---->");
  ASSERT_TRUE(DevSts::VerifyXml(xml, TrustedCredential().certificatePem));
  ExpectRefused(xml);
}

// Control: a value that is split by text is read whole.
TEST_P(SplitValuesTest, AreReadWholeWhenSplitByText) {
  const auto resolver = TrustedResolver();
  const std::string original = SignedXml(UnsignedXml());
  const std::string values = AllValues(*CreateSamlToken(original, resolver.get()));
  const std::string xml = SplitBy(original, GetParam(), "<![CDATA[]]>");
  EXPECT_EQ(AllValues(*CreateSamlToken(xml, resolver.get())), values);
}

INSTANTIATE_TEST_SUITE_P(Values, SplitValuesTest, testing::ValuesIn(SplitValues()),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
