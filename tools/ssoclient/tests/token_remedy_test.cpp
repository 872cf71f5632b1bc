#include "token_remedy.h"

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

namespace SsoClient::Tool {
namespace {

using testing::HasSubstr;

bool IsAboutAlgorithm(const std::string& text) {
  return IsAlgorithmUnsupported(InvalidSignatureException("Signature verification error. " + text));
}

TEST(TokenRemedyTest, AnUnsupportedAlgorithmIsRecognised) {
  EXPECT_TRUE(IsAboutAlgorithm("The signature algorithm 'urn:a' is not supported."));
  EXPECT_TRUE(IsAboutAlgorithm("The transform algorithm 'urn:a' is not supported."));
  EXPECT_FALSE(IsAboutAlgorithm("No trusted key is of the type of the signature algorithm."));
  EXPECT_FALSE(IsAboutAlgorithm("There is no trusted key for 'The signature algorithm 'a''."));
  EXPECT_FALSE(IsAlgorithmUnsupported(ParseException(
      "Signature verification error. The signature algorithm 'urn:a' is not supported.")));
}

TEST(TokenRemedyTest, EachReasonHasItsRemedy) {
  EXPECT_EQ(TokenRemedy(InvalidSignatureException(
                "Signature verification error. The digest algorithm 'urn:a' is not supported.")),
            kAlgorithmRemedy);
  EXPECT_THAT(TokenRemedy(InvalidSignatureException("Failed to verify signature")),
              HasSubstr("--sts-certificate"));
  EXPECT_THAT(TokenRemedy(ParseException("Token is not valid yet")), HasSubstr("clocks"));
}

}  // namespace
}  // namespace SsoClient::Tool
