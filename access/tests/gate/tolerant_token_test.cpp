#include "gate/tolerant_token.h"

#include <chrono>
#include <set>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <ssoclient/saml_token.h>

#include "gate/gate_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

class TolerantTokenTest : public GateFixture {};

template <class Value>
Value ValueOf(const SamlToken& token, void (SamlToken::*get)(Value&) const) {
  Value value;
  (token.*get)(value);
  return value;
}

}  // namespace

TEST_F(TolerantTokenTest, AcceptedTokenSaysTheToleranceOfTheGate) {
  config.clockTolerance = std::chrono::seconds(90);
  const Verdict verdict = Check(text);
  ASSERT_TRUE(verdict.IsAccepted()) << verdict.ToString();
  EXPECT_EQ(verdict.Token()->ExpirationTimeWithTolerance(),
            After(verdict.Token()->ExpirationTime(), std::chrono::seconds(90)));
}

TEST_F(TolerantTokenTest, EverythingElseIsTheTokensOwn) {
  const auto own = CreateSamlToken(Signed(HolderOfKeyText()), 600);
  const auto token = WithTolerance(own, std::chrono::seconds(1));
  EXPECT_EQ(&token->Id(), &own->Id());
  EXPECT_EQ(&token->StartTime(), &own->StartTime());
  EXPECT_EQ(&token->ExpirationTime(), &own->ExpirationTime());
  EXPECT_EQ(&token->Subject(), &own->Subject());
  EXPECT_EQ(&token->Issuer(), &own->Issuer());
  EXPECT_EQ(&token->Xml(), &own->Xml());
  EXPECT_EQ(token->IsRenewable(), own->IsRenewable());
  EXPECT_EQ(token->IsDelegable(), own->IsDelegable());
  EXPECT_EQ(token->IsSolution(), own->IsSolution());
  EXPECT_EQ(token->ConfirmationType(), own->ConfirmationType());
  EXPECT_EQ(token->HolderOfKeyCertificate().get(), own->HolderOfKeyCertificate().get());
  EXPECT_EQ(token->GetSignature().get(), own->GetSignature().get());
  EXPECT_EQ(ValueOf(*token, &SamlToken::GetAudiences), ValueOf(*own, &SamlToken::GetAudiences));
  EXPECT_EQ(ValueOf(*token, &SamlToken::GetGroups), ValueOf(*own, &SamlToken::GetGroups));
  EXPECT_EQ(CreateSamlTokenDescription(*token), CreateSamlTokenDescription(*own));
}

TEST_F(TolerantTokenTest, EndIsLimitedToTheRangeOfDateTime) {
  const auto own = CreateSamlToken(Signed(text), 600);
  const auto token = WithTolerance(own, std::chrono::hours(24) * 365 * 9000);
  EXPECT_EQ(token->ExpirationTimeWithTolerance().ToString(), "9999-12-31T23:59:59.999999Z");
}

}  // namespace SsoClient::Access::Testing
