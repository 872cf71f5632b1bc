// Renewal over real TLS.
#include <chrono>
#include <memory>
#include <set>
#include <string>
#include <vector>

#include <gmock/gmock.h>

#include "integration/holder_of_key_fixture.h"

namespace SsoClient::Testing {
namespace {

using std::chrono::seconds;
using testing::HasSubstr;
using testing::IsEmpty;

constexpr char kUnableToRenew[] = "Unexpected SOAP fault: wst:UnableToRenew; request failed.";

class RenewTokenTest : public HolderOfKeyTest {
 protected:
  static std::shared_ptr<const SamlToken> Renew(const SamlToken& token, long lifetime = 600) {
    return HolderService()->RenewToken(token, lifetime);
  }
  static std::string RefusalOf(const SamlToken& token) {
    const std::string message = MessageOf<SsoException>([&] { Renew(token); });
    EXPECT_EQ(message, kUnableToRenew);
    return Sts().LastRequest().answeredFault;
  }
};

TEST_F(RenewTokenTest, GivesANewTokenForTheRequestedLifetime) {
  const auto token = AcquireBound();
  const auto renewed = Renew(*token, 7200);
  EXPECT_NE(renewed->Id(), token->Id());
  EXPECT_EQ(renewed->Subject(), token->Subject());
  EXPECT_TRUE(IsBoundTo(*renewed, Holder()));
  const auto lifetime = renewed->ExpirationTime().GetUtcTime() - renewed->StartTime().GetUtcTime();
  EXPECT_EQ(lifetime, 7200L * 1'000'000);
}

TEST_F(RenewTokenTest, KeepsTheContentOfTheToken) {
  TokenSpec spec = RenewableAndDelegable();
  spec.audienceRestriction = {"https://a.example"};
  spec.advice = {{"urn:source", {{"urn:attribute", {"value"}}}}};
  const auto token = AcquireBound(spec);
  const auto renewed = Renew(*token);
  std::set<std::string> audiences;
  renewed->GetAudiences(audiences);
  EXPECT_EQ(audiences, spec.audienceRestriction);
  std::vector<Advice> advice;
  renewed->GetAdvice(advice);
  ASSERT_EQ(advice.size(), 1U);
  EXPECT_EQ(advice[0].source, "urn:source");
  std::vector<PrincipalId> before;
  std::vector<PrincipalId> after;
  token->GetGroups(before);
  renewed->GetGroups(after);
  EXPECT_EQ(after, before);
  EXPECT_FALSE(after.empty());
}

TEST_F(RenewTokenTest, CountsDownUntilTheTokenIsNoLongerRenewable) {
  DevSts::AssertionOptions options;
  options.renewCount = 3;
  Sts().SetAssertionOptions(options);
  auto token = AcquireBound();
  for (const int left : {2, 1, 0}) {
    EXPECT_TRUE(token->IsRenewable());
    token = Renew(*token);
    EXPECT_THAT(token->Xml(), HasSubstr("<saml2:Condition Count=\"" + std::to_string(left) + "\""));
  }
  EXPECT_FALSE(token->IsRenewable());
  EXPECT_EQ(RefusalOf(*token), "The RenewTarget may not be renewed any more");
}

TEST_F(RenewTokenTest, TokenThatIsNotRenewableIsRefusedByTheService) {
  EXPECT_EQ(RefusalOf(*AcquireBound(TenMinutes())), "The RenewTarget is not renewable");
}

// The client requests a lifetime that begins now, so the new token is not postdated. It keeps the
// right to be postdated.
TEST_F(RenewTokenTest, PostdatableTokenBeginsNowAndStaysPostdatable) {
  for (const bool postdatable : {false, true}) {
    DevSts::AssertionOptions options;
    options.postdatable = postdatable;
    Sts().SetAssertionOptions(options);
    const auto token = AcquireBound();
    const auto renewed = Renew(*token);
    EXPECT_THAT(renewed->Xml(),
                HasSubstr(std::string("Postdatable=\"") + (postdatable ? "true" : "false") + "\""));
    const auto now = Tarnik::System::GetUtcDateTime().GetUtcTime();
    EXPECT_LE(renewed->StartTime().GetUtcTime(), now);
  }
}

TEST_F(RenewTokenTest, TokenThatHasNotBegunIsRefused) {
  Sts().SetAssertionOptions(ValidBetween(seconds(100), seconds(200)));
  EXPECT_EQ(RefusalOf(*AcquireBound()), "The RenewTarget is not yet valid");
}

// Within the client's tolerance of ten minutes an expired token is still accepted.
TEST_F(RenewTokenTest, ExpiredTokenIsRenewedIfItsRestrictionAllowsIt) {
  for (const bool renewExpired : {false, true}) {
    DevSts::AssertionOptions options = ValidBetween(seconds(-100), seconds(-10));
    options.renewExpired = renewExpired;
    Sts().SetAssertionOptions(options);
    const auto token = AcquireBound();
    Sts().SetAssertionOptions({});
    if (renewExpired) {
      const auto renewed = Renew(*token);
      EXPECT_GT(renewed->ExpirationTime().GetUtcTime(), token->ExpirationTime().GetUtcTime());
      continue;
    }
    EXPECT_EQ(RefusalOf(*token),
              "The RenewTarget has expired, and it is not renewable after its end");
  }
}

TEST_F(RenewTokenTest, BearerTokenIsRefusedBeforeAnythingIsSent) {
  TokenSpec spec = Bearer();
  spec.renewable = true;
  const auto token = Acquire(spec);
  Sts().ClearRequests();
  EXPECT_EQ(MessageOf<Tarnik::InvalidArgumentException>([&] { Renew(*token); }),
            "Unable to renew token: the provided token must be Holder Of Key");
  EXPECT_THAT(Sts().Requests(), IsEmpty());
}

TEST_F(RenewTokenTest, NewCertificateOfTheSameKeyRenewsToo) {
  const auto token = AcquireBound();
  const auto service = HolderService(HolderValidBetween(seconds(-60), seconds(3600)));
  EXPECT_EQ(service->RenewToken(*token, 60)->Subject(), token->Subject());
}

}  // namespace
}  // namespace SsoClient::Testing
