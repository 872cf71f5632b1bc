// Tokens bound to the client's key: by password and by certificate.
#include <set>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "integration/holder_of_key_fixture.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

class HolderOfKeyTokenTest : public HolderOfKeyTest {};

long LifetimeOf(const SamlToken& token) {
  return (token.ExpirationTime().GetUtcTime() - token.StartTime().GetUtcTime()) / 1'000'000;
}

TEST_F(HolderOfKeyTokenTest, ByPasswordIsBoundToTheCertificate) {
  const auto token = AcquireBound(TenMinutes());
  EXPECT_EQ(token->Subject(), (PrincipalId{"alice", "EXAMPLE.COM"}));
  EXPECT_TRUE(IsBoundTo(*token, Holder()));
  EXPECT_FALSE(IsBoundTo(*token, Stranger()));
  EXPECT_EQ(LifetimeOf(*token), 600);
  EXPECT_FALSE(token->IsRenewable());
  EXPECT_FALSE(token->IsDelegable());
  EXPECT_THAT(ChainOf(*token), IsEmpty());
}

TEST_F(HolderOfKeyTokenTest, ByPasswordTheSpecReachesTheToken) {
  TokenSpec spec = RenewableAndDelegable();
  spec.tokenLifetimeSec = 1234;
  spec.audienceRestriction = {"https://b.example", "https://a.example"};
  spec.advice = {{"urn:source", {{"urn:attribute", {"one", "two"}}}}};
  const auto token = AcquireBound(spec);
  EXPECT_EQ(LifetimeOf(*token), 1234);
  EXPECT_TRUE(token->IsRenewable());
  EXPECT_TRUE(token->IsDelegable());
  std::set<std::string> audiences;
  token->GetAudiences(audiences);
  EXPECT_THAT(audiences, ElementsAre("https://a.example", "https://b.example"));
  std::vector<Advice> advice;
  token->GetAdvice(advice);
  ASSERT_EQ(advice.size(), 1U);
  ASSERT_EQ(advice[0].attributes.size(), 1U);
  EXPECT_THAT(advice[0].attributes[0].values, ElementsAre("one", "two"));
}

TEST_F(HolderOfKeyTokenTest, ByPasswordIsABearerTokenIfRequested) {
  const auto token = AcquireBound(Bearer());
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_EQ(token->ConfirmationType(), BEARER);
  EXPECT_EQ(token->HolderOfKeyCertificate(), nullptr);
}

TEST_F(HolderOfKeyTokenTest, ByPasswordWithoutAConfigIsAlwaysABearerToken) {
  for (const TokenSpec& spec : {TenMinutes(), Bearer()}) {
    const auto token = Service()->AcquireToken(kUser, kPassword, spec);
    EXPECT_EQ(token->ConfirmationType(), BEARER);
    EXPECT_EQ(token->HolderOfKeyCertificate(), nullptr);
  }
}

TEST_F(HolderOfKeyTokenTest, ByPasswordMayBeForADelegate) {
  TokenSpec spec = RenewableAndDelegable();
  spec.delegateTo = std::string("bob@EXAMPLE.COM");
  const auto token = AcquireBound(spec);
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_THAT(ChainOf(*token), ElementsAre("bob"));
  EXPECT_TRUE(IsBoundTo(*token, Holder()));
}

TEST_F(HolderOfKeyTokenTest, ByCertificateBelongsToTheCertificatesOwner) {
  const auto token = HolderService()->AcquireTokenByCertificate(RenewableAndDelegable());
  EXPECT_EQ(token->Subject(), (PrincipalId{"machine", "EXAMPLE.COM"}));
  EXPECT_TRUE(token->IsSolution());
  EXPECT_TRUE(token->IsRenewable());
  EXPECT_TRUE(token->IsDelegable());
  EXPECT_TRUE(IsBoundTo(*token, Holder()));
  EXPECT_EQ(LifetimeOf(*token), 600);
}

TEST_F(HolderOfKeyTokenTest, ByCertificateMayActForAnother) {
  TokenSpec delegable = TenMinutes();
  delegable.delegable = true;
  TokenSpec spec = TenMinutes();
  spec.actAsToken = Acquire(delegable);
  const auto token = HolderService()->AcquireTokenByCertificate(spec);
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_THAT(ChainOf(*token), ElementsAre("machine"));
  EXPECT_TRUE(IsBoundTo(*token, Holder()));
}

TEST_F(HolderOfKeyTokenTest, EachRequestOfAServiceHasANewSignature) {
  const auto service = HolderService();
  std::set<std::string> signatures;
  for (int i = 0; i < 3; ++i) {
    service->AcquireTokenByCertificate(TenMinutes());
    const std::string body = Sts().LastRequest().body;
    const auto from = body.find("<ds:SignatureValue>");
    ASSERT_NE(from, std::string::npos);
    signatures.insert(body.substr(from, body.find("</ds:SignatureValue>") - from));
  }
  EXPECT_EQ(signatures.size(), 3U);
}

}  // namespace
}  // namespace SsoClient::Testing
