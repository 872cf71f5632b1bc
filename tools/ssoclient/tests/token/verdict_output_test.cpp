#include "token/verdict_output.h"

#include <map>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

using Access::Reason;
using Access::Remedy;
using testing::EndsWith;
using testing::HasSubstr;

TEST(VerdictOutputTest, ARemedyHasTheStatusOfItsKind) {
  const std::map<Remedy, std::string> endings = {{Remedy::kNewToken, " (HTTP 401)"},
                                                 {Remedy::kAccess, " (HTTP 403)"},
                                                 {Remedy::kService, " (HTTP 503)"}};
  for (int i = 1; i <= static_cast<int>(Reason::kPredicateFailed); ++i) {
    const auto reason = static_cast<Reason>(i);
    EXPECT_THAT(RemedyText(reason), EndsWith(endings.at(RemedyOf(reason))));
  }
  EXPECT_EQ(RemedyText(Reason::kNone), "");
}

TEST(VerdictOutputTest, OnlyAMissingProofIsToBeGiven) {
  for (int i = 1; i <= static_cast<int>(Reason::kPredicateFailed); ++i) {
    const auto reason = static_cast<Reason>(i);
    const bool isAboutProof = reason == Reason::kNoProof || reason == Reason::kWrongProof;
    EXPECT_EQ(RemedyText(reason).find("prove the key") != std::string::npos, isAboutProof)
        << Access::NameOf(reason);
  }
}

TEST(VerdictOutputTest, ARemedyFitsTheReason) {
  EXPECT_THAT(RemedyText(Reason::kExpired), HasSubstr("has not expired"));
  EXPECT_THAT(RemedyText(Reason::kNotYetValid), HasSubstr("wait"));
  EXPECT_THAT(RemedyText(Reason::kUnknownIssuer), HasSubstr("issuer"));
  EXPECT_THAT(RemedyText(Reason::kSignerRevoked), HasSubstr("certificate"));
  EXPECT_THAT(RemedyText(Reason::kWrongAudience), HasSubstr("audience"));
  EXPECT_THAT(RemedyText(Reason::kBearerRefused), HasSubstr("bound to a key"));
  EXPECT_THAT(RemedyText(Reason::kTooLongLived), HasSubstr("shorter lifetime"));
  EXPECT_THAT(RemedyText(Reason::kTooDeeplyDelegated), HasSubstr("fewer delegates"));
  EXPECT_THAT(RemedyText(Reason::kTooLarge), HasSubstr("smaller"));
}

}  // namespace
}  // namespace SsoClient::Tool
