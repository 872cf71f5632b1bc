// Validation over real TLS.
#include <chrono>
#include <string>

#include <gmock/gmock.h>

#include <devsts/xml_security.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/text_edits.h"
#include "integration/wire_request.h"

namespace SsoClient::Testing {
namespace {

using std::chrono::seconds;
using testing::HasSubstr;

class ValidateSubjectTest : public HolderOfKeyTest {
 protected:
  // Validates with and without a holder-of-key configuration, which must not make a difference.
  static bool IsValid(const SamlToken& token) {
    const bool verdict = Service()->ValidateSubject(token);
    EXPECT_EQ(HolderService()->ValidateSubject(token), verdict);
    return verdict;
  }
};

TEST_F(ValidateSubjectTest, GoodTokenIsValidUntilItIsRevoked) {
  for (const auto& token : {Acquire(), AcquireBound()}) {
    EXPECT_TRUE(IsValid(*token));
    ASSERT_TRUE(Sts().Revoke(token->Id()));
    EXPECT_FALSE(IsValid(*token));
  }
}

TEST_F(ValidateSubjectTest, RevokingOneTokenLeavesTheOthers) {
  const auto one = AcquireBound();
  const auto other = AcquireBound();
  ASSERT_TRUE(Sts().Revoke(one->Id()));
  EXPECT_TRUE(IsValid(*other));
}

TEST_F(ValidateSubjectTest, TokenOutsideItsPeriodIsNotValid) {
  for (const long start : {-200L, 100L}) {
    Sts().SetAssertionOptions(ValidBetween(seconds(start), seconds(start + 100)));
    EXPECT_FALSE(IsValid(*Acquire())) << start;
    EXPECT_FALSE(IsValid(*AcquireBound())) << start;
  }
}

TEST_F(ValidateSubjectTest, TokenOfAnotherServiceIsNotValid) {
  const DevSts::Server other;
  const auto token =
      MakeService(other, other.HttpsUrl())->AcquireToken(kUser, kPassword, TenMinutes());
  EXPECT_FALSE(IsValid(*token));
}

TEST_F(ValidateSubjectTest, ForgedTokenIsNotValid) {
  std::string xml = AcquireBound()->Xml();
  Replace(xml, ">alice@", ">carol@");
  EXPECT_FALSE(IsValid(*CreateSamlToken(xml)));
}

TEST_F(ValidateSubjectTest, RequestIsTheExpectedOne) {
  const auto token = AcquireBound();
  HolderService()->ValidateSubject(*token);
  const auto request = Sts().LastRequest();
  EXPECT_EQ(request.Header("SOAPAction"),
            "\"http://docs.oasis-open.org/ws-sx/ws-trust/200512/RST/Validate\"");
  EXPECT_THAT(request.body,
              HasSubstr("<wst:TokenType>http://docs.oasis-open.org/ws-sx/ws-trust/200512/RSTR/"
                        "Status</wst:TokenType>"));
  const std::string sent =
      DevSts::Canonicalize(AssertionIn(request.body), "", DevSts::CanonicalMode::Inclusive);
  EXPECT_TRUE(sent == token->Xml());
}

}  // namespace
}  // namespace SsoClient::Testing
