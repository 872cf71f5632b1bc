#include "support/second_opinion.h"

#include <chrono>
#include <cstddef>
#include <optional>
#include <random>
#include <string>

#include <gtest/gtest.h>

#include <devsts/xml_security.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>

#include "support/assertion_text.h"
#include "support/forgeries.h"
#include "support/token_editor.h"
#include "support/token_values.h"

// Every token that a resolver accepts has the signed values, and an independent verifier of XML
// signatures accepts it too. Tested with signed assertions of every kind, edited at random.
namespace SsoClient::Testing {
namespace {

constexpr std::chrono::seconds kTime{4};

/// The values of the token with this text, or nothing if it is refused.
std::optional<std::string> AcceptedValues(const std::string& xml) {
  static const auto resolver = TrustedResolver();
  try {
    return AllValues(*CreateSamlToken(xml, resolver.get()));
  } catch (const Tarnik::Exception&) {
    return std::nullopt;
  }
}

TEST(SecondOpinionTest, AcceptsWhateverTheLibraryAccepts) {
  const unsigned seed = std::random_device()();
  SCOPED_TRACE("seed " + std::to_string(seed));
  std::mt19937 random(seed);
  const auto below = [&random](std::size_t bound) {
    return std::uniform_int_distribution<std::size_t>(0, bound - 1)(random);
  };
  TokenEditor editor(below);
  const auto end = std::chrono::steady_clock::now() + kTime;
  std::size_t accepted = 0;
  std::size_t refused = 0;
  std::string original;
  std::optional<std::string> values;
  while (std::chrono::steady_clock::now() < end) {
    if ((accepted + refused) % 64 == 0) {
      original = editor.SignedXml();
      values = AcceptedValues(original);
      ASSERT_TRUE(values) << original;
    }
    std::string xml = original;
    for (std::size_t edits = 1 + below(3); edits > 0; --edits) {
      editor.Edit(xml);
    }
    const std::optional<std::string> edited = AcceptedValues(xml);
    if (!edited) {
      ++refused;
      continue;
    }
    ++accepted;
    ASSERT_EQ(*edited, *values) << xml;
    ASSERT_EQ(SecondOpinionOf(xml), "") << xml;
  }
  // Some edits are harmless, and others make the token invalid.
  EXPECT_GT(accepted, 0U);
  EXPECT_GT(refused, 0U);
}

// Control: the independent verifier does not accept everything.
TEST(SecondOpinionTest, RejectsATamperedAssertion) {
  const std::string xml = Replaced(OriginalAssertion(), "alice@", "admin@");
  EXPECT_EQ(AcceptedValues(xml), std::nullopt);
  EXPECT_NE(SecondOpinionOf(xml), "");
}

const std::string kUnusedPrefix = "<saml2:Subject xmlns:unused=\"urn:[\">";

std::string WithMalformedNamespace() {
  return Replaced(OriginalAssertion(), "<saml2:Subject>", kUnusedPrefix);
}

TEST(SecondOpinionTest, IgnoresAnUnusedMalformedNamespace) {
  const std::string xml = WithMalformedNamespace();
  EXPECT_TRUE(AcceptedValues(xml));
  EXPECT_FALSE(DevSts::VerifyXml(xml, TrustedCredential().certificatePem));
  EXPECT_EQ(SecondOpinionOf(xml), "");
}

// Control: a malformed namespace does not hide another error.
TEST(SecondOpinionTest, RejectsATamperedAssertionWithAMalformedNamespace) {
  EXPECT_NE(SecondOpinionOf(Replaced(WithMalformedNamespace(), "alice@", "admin@")), "");
  EXPECT_NE(SecondOpinionOf(Replaced(OriginalAssertion(),
                                     "xmlns:saml2=\"urn:oasis:names:tc:SAML:2.0:assertion\"",
                                     "xmlns:saml2=\"urn:[\"")),
            "");
}

}  // namespace
}  // namespace SsoClient::Testing
