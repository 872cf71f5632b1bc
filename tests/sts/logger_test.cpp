#include "sts/logger.h"

#include <stdexcept>

#include <gmock/gmock.h>

#include "sts/log_capture.h"

namespace SsoClient::Testing {
namespace {

using testing::ElementsAre;
using testing::IsEmpty;

TEST(LoggerTest, IsNamedAfterTheLibrary) {
  EXPECT_STREQ(kLogger.Name(), "SsoClient");
}

TEST(OperationLogTest, WritesStartAndEndAtLevelSeven) {
  const LogCapture log(7);
  {
    const OperationLog operation("AcquireToken");
    EXPECT_THAT(log.Lines(),
                ElementsAre("7 START operation SecurityTokenServiceImpl::AcquireToken"));
  }
  EXPECT_THAT(log.Lines(), ElementsAre("7 START operation SecurityTokenServiceImpl::AcquireToken",
                                       "7 END operation SecurityTokenServiceImpl::AcquireToken"));
}

TEST(OperationLogTest, WritesTheEndOfAnOperationThatFails) {
  const LogCapture log(7);
  try {
    const OperationLog operation("X");
    throw std::runtime_error("failed");
  } catch (const std::runtime_error&) {
  }
  EXPECT_THAT(log.Lines(), ElementsAre("7 START operation SecurityTokenServiceImpl::X",
                                       "7 END operation SecurityTokenServiceImpl::X"));
}

TEST(OperationLogTest, IsSilentBelowLevelSeven) {
  const LogCapture log(6);
  { const OperationLog operation("X"); }
  EXPECT_THAT(log.Lines(), IsEmpty());
}

}  // namespace
}  // namespace SsoClient::Testing
