// Tokens acquired with another token: plain, delegated, and on behalf of another user.
#include <memory>
#include <set>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>

#include "integration/holder_of_key_fixture.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::HasSubstr;
using testing::IsEmpty;

class AcquireByTokenTest : public HolderOfKeyTest {
 protected:
  static std::shared_ptr<const SamlToken> ByToken(const SamlToken& token, const TokenSpec& spec) {
    return HolderService()->AcquireTokenByToken(token, spec);
  }
  static TokenSpec DelegatedTo(const std::string& name) {
    TokenSpec spec = RenewableAndDelegable();
    spec.delegateTo = name;
    return spec;
  }
  static TokenSpec OnBehalfOf(std::shared_ptr<const SamlToken> token) {
    TokenSpec spec = RenewableAndDelegable();
    spec.actAsToken = std::move(token);
    return spec;
  }
  static std::shared_ptr<const SamlToken> MachineToken() {
    return HolderService()->AcquireTokenByCertificate(RenewableAndDelegable());
  }
};

TEST_F(AcquireByTokenTest, GivesANewTokenOfTheSameSubjectAndKey) {
  const auto first = AcquireBound();
  const auto second = ByToken(*first, TenMinutes());
  EXPECT_NE(second->Id(), first->Id());
  EXPECT_EQ(second->Subject(), first->Subject());
  EXPECT_TRUE(IsBoundTo(*second, Holder()));
  EXPECT_THAT(ChainOf(*second), IsEmpty());
}

TEST_F(AcquireByTokenTest, GivesABearerTokenIfRequested) {
  const auto token = ByToken(*AcquireBound(), Bearer());
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_EQ(token->ConfirmationType(), BEARER);
}

TEST_F(AcquireByTokenTest, NarrowsTheAudience) {
  TokenSpec spec = TenMinutes();
  spec.audienceRestriction = {"https://a.example"};
  const auto token = ByToken(*AcquireBound(), spec);
  std::set<std::string> audiences;
  token->GetAudiences(audiences);
  EXPECT_THAT(audiences, ElementsAre("https://a.example"));
}

TEST_F(AcquireByTokenTest, DelegatesAndKeepsTheRightToDelegate) {
  const auto token = ByToken(*AcquireBound(), DelegatedTo("bob@EXAMPLE.COM"));
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_THAT(ChainOf(*token), ElementsAre("bob"));
  EXPECT_TRUE(token->IsDelegable());
  EXPECT_TRUE(IsBoundTo(*token, Holder()));
}

TEST_F(AcquireByTokenTest, DelegationsAreListedInOrder) {
  const auto first = ByToken(*AcquireBound(), DelegatedTo("bob@EXAMPLE.COM"));
  const auto second = ByToken(*first, DelegatedTo("machine@EXAMPLE.COM"));
  const auto third = ByToken(*second, DelegatedTo("carol@EXAMPLE.COM"));
  EXPECT_THAT(ChainOf(*third), ElementsAre("bob", "machine", "carol"));
  std::vector<Delegate> chain;
  third->GetDelegationChain(chain);
  EXPECT_LE(chain[0].delegationInstant.GetUtcTime(), chain[1].delegationInstant.GetUtcTime());
  EXPECT_LE(chain[1].delegationInstant.GetUtcTime(), chain[2].delegationInstant.GetUtcTime());
}

TEST_F(AcquireByTokenTest, RightToDelegateRunsOut) {
  DevSts::AssertionOptions options;
  options.proxyCount = 1;
  Sts().SetAssertionOptions(options);
  const auto first = AcquireBound();
  EXPECT_TRUE(first->IsDelegable());
  const auto second = ByToken(*first, DelegatedTo("bob@EXAMPLE.COM"));
  EXPECT_FALSE(second->IsDelegable());
  EXPECT_EQ(MessageOf<SsoException>([&] { ByToken(*second, DelegatedTo("carol@EXAMPLE.COM")); }),
            "Unexpected SOAP fault: wst:InvalidRequest; request failed.");
  EXPECT_NE(ByToken(*second, TenMinutes()), nullptr);
}

TEST_F(AcquireByTokenTest, ActsForTheSubjectOfABearerToken) {
  const auto token = ByToken(*MachineToken(), OnBehalfOf(DelegableBearer()));
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_THAT(ChainOf(*token), ElementsAre("machine"));
  EXPECT_TRUE(IsBoundTo(*token, Holder()));
}

TEST_F(AcquireByTokenTest, ActsForTheSubjectAndDelegates) {
  TokenSpec spec = OnBehalfOf(DelegableBearer());
  spec.delegateTo = std::string("bob@EXAMPLE.COM");
  const auto token = ByToken(*MachineToken(), spec);
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_THAT(ChainOf(*token), ElementsAre("machine", "bob"));
}

TEST_F(AcquireByTokenTest, ADelegateActsWithoutAppearingInTheChainTwice) {
  const auto delegated = Acquire(DelegatedTo("machine@EXAMPLE.COM"));
  const auto token = ByToken(*MachineToken(), OnBehalfOf(delegated));
  EXPECT_THAT(ChainOf(*token), ElementsAre("machine"));
}

TEST_F(AcquireByTokenTest, AHolderOfKeyTokenMayBeTheActAsToken) {
  const auto token = ByToken(*MachineToken(), OnBehalfOf(AcquireBound()));
  EXPECT_EQ(token->Subject().name, "alice");
  EXPECT_THAT(ChainOf(*token), ElementsAre("machine"));
}

// The request contains one ID twice then.
TEST_F(AcquireByTokenTest, ReportsTheServicesRefusalOfOneTokenTwice) {
  const auto token = MachineToken();
  EXPECT_EQ(MessageOf<SsoException>([&] { ByToken(*token, OnBehalfOf(token)); }),
            "Unexpected SOAP fault: wsse:InvalidSecurity; request failed.");
  EXPECT_THAT(Sts().LastRequest().answeredFault,
              HasSubstr("The request is ambiguous: two elements have the id " + token->Id()));
}

TEST_F(AcquireByTokenTest, RefusesToActForTheSubjectOfATokenThatIsNotDelegable) {
  EXPECT_EQ(MessageOf<SsoException>([] { ByToken(*MachineToken(), OnBehalfOf(Acquire())); }),
            "Unexpected SOAP fault: wst:InvalidRequest; request failed.");
  EXPECT_THAT(Sts().LastRequest().answeredFault, HasSubstr("may not be delegated to machine@"));
}

// A renewed token keeps the delegations of the token before it.
TEST_F(AcquireByTokenTest, RenewalKeepsTheChain) {
  const auto delegated = ByToken(*AcquireBound(), DelegatedTo("bob@EXAMPLE.COM"));
  EXPECT_THAT(ChainOf(*HolderService()->RenewToken(*delegated, 60)), ElementsAre("bob"));
}

}  // namespace
}  // namespace SsoClient::Testing
