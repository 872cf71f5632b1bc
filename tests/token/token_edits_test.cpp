#include "support/token_edits.h"

#include <string>

#include <gtest/gtest.h>

#include <devsts/xml_security.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>

#include "support/assertion_text.h"
#include "support/thrown_message.h"
#include "support/token_values.h"

// Edits of a signed token's text. Edits that do not change the canonical form do not change values,
// and edits of a value are refused as tampering.
namespace SsoClient::Testing {
namespace {

std::string SignedXml() {
  static const std::string xml = AssertionText().Delegate().ToSignedXml(TrustedCredential());
  return xml;
}

class NeutralEditTest : public testing::TestWithParam<Edit> {};

TEST_P(NeutralEditTest, KeepsVerdictAndValues) {
  const auto resolver = TrustedResolver();
  const std::string edited = Replaced(SignedXml(), GetParam().from, GetParam().to);
  EXPECT_EQ(AllValues(*CreateSamlToken(edited, resolver.get())),
            AllValues(*CreateSamlToken(SignedXml(), resolver.get())));
}

INSTANTIATE_TEST_SUITE_P(CanonicalForm, NeutralEditTest, testing::ValuesIn(NeutralEdits()));

TEST(NeutralEditTest, AcceptsTextAroundTheDocumentElement) {
  const auto resolver = TrustedResolver();
  EXPECT_EQ(AllValues(*CreateSamlToken("<?xml version=\"1.0\"?>\r\n<!--c-->" + SignedXml() + "\n",
                                       resolver.get())),
            AllValues(*CreateSamlToken(SignedXml(), resolver.get())));
}

// The name in xsi:type depends on a declaration that exclusive canonical text omits if no element
// or attribute uses its prefix. So it can be changed without breaking the signature, but the type
// is then unknown.
TEST(PrefixEditTest, OfATypesNamespaceMakesTheTypeUnknown) {
  AssertionText text;
  text.advice.clear();
  const std::string original = text.ToSignedXml(TrustedCredential());
  const auto resolver = TrustedResolver();
  EXPECT_TRUE(CreateSamlToken(original, resolver.get())->IsRenewable());
  const std::string condition = "<saml2:Condition xsi:type=\"rsa:RenewRestrictionType\"";
  for (const char* uri : {"urn:other", "urn:oasis:names:tc:SAML:2.0:conditions:delegation",
                          "urn:oasis:names:tc:SAML:2.0:assertion"}) {
    const std::string edited =
        Replaced(original, condition, condition + " xmlns:rsa=\"" + uri + "\"");
    ASSERT_TRUE(DevSts::VerifyXml(edited, TrustedCredential().certificatePem));
    EXPECT_EQ(ThrownMessage<ParseException>([&] { CreateSamlToken(edited, resolver.get()); }),
              "Unknown or duplicate restriction node under Conditions");
  }
}

class ValueEditTest : public testing::TestWithParam<Edit> {};

TEST_P(ValueEditTest, IsRefusedAsTampering) {
  const std::string edited = Replaced(SignedXml(), GetParam().from, GetParam().to);
  // Control: without a resolver the text is accepted.
  EXPECT_NO_THROW(CreateSamlToken(edited));
  EXPECT_THROW(CreateSamlToken(edited, TrustedResolver().get()), InvalidSignatureException);
}

INSTANTIATE_TEST_SUITE_P(EveryValue, ValueEditTest, testing::ValuesIn(ValueEdits()));

}  // namespace
}  // namespace SsoClient::Testing
