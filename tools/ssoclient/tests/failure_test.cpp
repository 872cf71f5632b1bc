#include "failure.h"

#include <stdexcept>

#include <gtest/gtest.h>

#include <ssoclient/exceptions.h>

namespace SsoClient::Tool {
namespace {

TEST(FailureTest, ARefusedLoginIsARefusal) {
  const Failure failure = FailureOf(InvalidCredentialsException("no"));
  EXPECT_EQ(failure.status, ExitStatus::kRefused);
  EXPECT_EQ(failure.kind, "refused-login");
  EXPECT_EQ(failure.message, "no");
  EXPECT_NE(failure.remedy, "");
}

TEST(FailureTest, AFailedExchangeMeansThatTheServiceIsUnreachable) {
  const Failure failure = FailureOf(CommunicationException("cut"));
  EXPECT_EQ(failure.status, ExitStatus::kUnreachable);
  EXPECT_EQ(failure.kind, "unreachable");
}

TEST(FailureTest, FailuresOfTheProgramAreKept) {
  const Failure failure =
      FailureOf(ToolException({ExitStatus::kUsage, "no-password", "one, please", "omit one"}));
  EXPECT_EQ(failure.status, ExitStatus::kUsage);
  EXPECT_EQ(failure.kind, "no-password");
  EXPECT_EQ(failure.message, "one, please");
  EXPECT_EQ(failure.remedy, "omit one");
}

TEST(FailureTest, OtherExceptionsAreLocal) {
  const Failure failure = FailureOf(std::runtime_error("disk"));
  EXPECT_EQ(failure.status, ExitStatus::kLocal);
  EXPECT_EQ(failure.message, "disk");
}

}  // namespace
}  // namespace SsoClient::Tool
