// Attacks that a token gate has to refuse, too: see access/tests/gate_attacks.
#include "support/token_cases.h"

#include <algorithm>
#include <ostream>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "support/assertion_text.h"

namespace SsoClient::Testing {

void PrintTo(const TokenCases& cases, std::ostream* stream) {
  *stream << cases.name;
}

namespace {

// Of a token that is about alice.
Fate FateOf(const std::string& text, const Tarnik::Xml::Security::KeyInfoResolver* resolver) {
  try {
    return CreateSamlToken(text, resolver)->Subject().name == "alice" ? Fate::kAccepted
                                                                      : Fate::kRefused;
  } catch (const Tarnik::Xml::XMLParseException&) {
    return Fate::kNotXml;
  } catch (const InvalidSignatureException&) {
    return Fate::kBadSignature;
  } catch (const ParseException&) {
    return Fate::kNotAToken;
  }
}

// The exceptions for both are the same.
Fate Expected(Fate fate) {
  return fate == Fate::kNoTrustedKey ? Fate::kBadSignature : fate;
}

class TokenCasesTest : public testing::TestWithParam<TokenCases> {};

TEST_P(TokenCasesTest, HaveTheirFates) {
  const auto resolver = TrustedResolver();
  const std::vector<TokenCase> cases = GetParam().make();
  for (const TokenCase& tested : cases) {
    const Fate fate = FateOf(tested.text, resolver.get());
    if (tested.fate == Fate::kRefused) {
      EXPECT_NE(fate, Fate::kAccepted) << tested.name;
    } else {
      EXPECT_EQ(fate, Expected(tested.fate)) << tested.name;
    }
  }
  const auto isAccepted = [](const TokenCase& tested) { return tested.fate == Fate::kAccepted; };
  EXPECT_TRUE(std::any_of(cases.begin(), cases.end(), isAccepted));
  EXPECT_FALSE(std::all_of(cases.begin(), cases.end(), isAccepted));
}

INSTANTIATE_TEST_SUITE_P(Attacks, TokenCasesTest, testing::ValuesIn(AllTokenCases()),
                         [](const auto& tested) { return std::string(tested.param.name); });

}  // namespace
}  // namespace SsoClient::Testing
