// The attacks of tests/support/token_cases.h at a gate: it accepts exactly the texts that the core
// accepts with a resolver of the same certificates, and its reasons fit the core's exceptions.
#include "support/token_cases.h"

#include <algorithm>
#include <ostream>

#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <tarnik/xml/xml_parse_exception.h>

#include "gate_attacks/attack_fixture.h"

namespace SsoClient::Testing {

void PrintTo(const TokenCases& cases, std::ostream* stream) {
  *stream << cases.name;
}

}  // namespace SsoClient::Testing

namespace SsoClient::Access::Testing {
namespace {

using SsoClient::Testing::Fate;
using SsoClient::Testing::TokenCase;
using SsoClient::Testing::TokenCases;

using Reasons = std::vector<Reason>;

Reasons ReasonsOf(Fate fate) {
  switch (fate) {
    case Fate::kAccepted:
      return {Reason::kNone};
    case Fate::kNotXml:
      return {Reason::kNotWellFormed};
    case Fate::kNotAToken:
      return {Reason::kBadLayout};
    case Fate::kNoTrustedKey:
      return {Reason::kUnknownIssuer, Reason::kUnknownSigner};
    case Fate::kBadSignature:
      return {Reason::kBadSignature};
    case Fate::kRefused:
      break;
  }
  return {Reason::kNotWellFormed, Reason::kBadLayout, Reason::kUnknownIssuer,
          Reason::kUnknownSigner, Reason::kBadSignature};
}

// The reasons that fit what the core says about a text.
Reasons ReasonsByCore(const std::string& text,
                      const Tarnik::Xml::Security::KeyInfoResolver* resolver) {
  try {
    CreateSamlToken(text, resolver);
    return {Reason::kNone};
  } catch (const Tarnik::Xml::XMLParseException&) {
    return {Reason::kNotWellFormed};
  } catch (const InvalidSignatureException&) {
    return {Reason::kUnknownIssuer, Reason::kUnknownSigner, Reason::kBadSignature};
  } catch (const ParseException&) {
    return {Reason::kBadLayout};
  }
}

bool IsAmong(Reason reason, const Reasons& reasons) {
  return std::find(reasons.begin(), reasons.end(), reason) != reasons.end();
}

class GateTokenCasesTest : public AttackFixture, public ::testing::WithParamInterface<TokenCases> {
 protected:
  GateTokenCasesTest() {
    config.acceptsUnrestrictedTokens = true;
    config.largestToken = std::size_t{64} * 1024 * 1024;
    config.clock = nullptr;  // the core uses the system's
    config.cache.bytes = config.largestToken * 8;
  }

  const Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> resolver =
      SsoClient::Testing::TrustedResolver();
};

void ExpectFitting(const Verdict& verdict, const TokenCase& tested, const Reasons& byCore) {
  const bool fits =
      IsAmong(verdict.Refusal(), ReasonsOf(tested.fate)) && IsAmong(verdict.Refusal(), byCore);
  EXPECT_TRUE(fits) << tested.name << ": " << verdict.ToString();
  EXPECT_EQ(verdict.IsAccepted(), verdict.Refusal() == Reason::kNone);
  if (verdict.IsAccepted()) {
    EXPECT_EQ(verdict.Token()->Subject().name, "alice") << tested.name;
    EXPECT_EQ(verdict.Token()->Xml(), tested.text) << tested.name;
  }
}

TEST_P(GateTokenCasesTest, HaveTheirFates) {
  const auto gate = Make();
  std::size_t accepted = 0;
  for (const TokenCase& tested : GetParam().make()) {
    const Reasons byCore = ReasonsByCore(tested.text, resolver.get());
    ExpectFitting(gate->Check(tested.text, Presenter::Nobody()), tested, byCore);
    // A remembered token has the same verdict; nothing of a refused one is remembered.
    ExpectFitting(gate->Check(tested.text, Presenter::Nobody()), tested, byCore);
    accepted += tested.fate == Fate::kAccepted ? 1 : 0;
  }
  EXPECT_GT(accepted, 0U);
  EXPECT_LE(gate->Metrics().cachedTokens, accepted);
  EXPECT_EQ(gate->Metrics().cacheHits, accepted);
}

INSTANTIATE_TEST_SUITE_P(Attacks, GateTokenCasesTest,
                         ::testing::ValuesIn(SsoClient::Testing::AllTokenCases()),
                         [](const auto& tested) { return std::string(tested.param.name); });

}  // namespace
}  // namespace SsoClient::Access::Testing
