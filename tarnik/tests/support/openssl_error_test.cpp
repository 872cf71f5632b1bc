#include "support/openssl_error.h"

#include <string>

#include <gtest/gtest.h>
#include <openssl/err.h>

namespace Tarnik::Testing {
namespace {

void RaiseOutOfMemoryAndMore() {
  ERR_raise(ERR_LIB_BN, ERR_R_MALLOC_FAILURE);
  ERR_raise(ERR_LIB_RSA, ERR_R_BN_LIB);
}

class OpenSslErrorTest : public testing::Test {
 protected:
  OpenSslErrorTest() { ERR_clear_error(); }
  ~OpenSslErrorTest() override { ERR_clear_error(); }
};

TEST_F(OpenSslErrorTest, FreshErrorsPutTheErrorsOfTheHostBack) {
  ERR_raise_data(ERR_LIB_X509, ERR_R_INTERNAL_ERROR, "of %s", "the host");
  ERR_raise(ERR_LIB_EVP, ERR_R_PASSED_INVALID_ARGUMENT);
  const unsigned long first = ERR_peek_error();
  const unsigned long second = ERR_peek_last_error();
  {
    const OpenSsl::FreshErrors errors;
    EXPECT_EQ(ERR_peek_error(), 0U);
    RaiseOutOfMemoryAndMore();
  }
  const char* data = nullptr;
  int flags = 0;
  EXPECT_EQ(ERR_get_error_all(nullptr, nullptr, nullptr, &data, &flags), first);
  EXPECT_STREQ(data, "of the host");
  EXPECT_EQ(ERR_get_error(), second);
  EXPECT_EQ(ERR_get_error(), 0U);
}

TEST_F(OpenSslErrorTest, FreshErrorsReportTheCauseAndAFailedAllocation) {
  const OpenSsl::FreshErrors errors;
  EXPECT_EQ(errors.Take().cause, 0U);
  ERR_raise(ERR_LIB_RSA, ERR_R_BN_LIB);
  const unsigned long cause = ERR_peek_error();
  ERR_raise(ERR_LIB_EVP, ERR_R_INTERNAL_ERROR);
  const OpenSsl::ErrorReport report = errors.Take();
  EXPECT_EQ(report.cause, cause);
  EXPECT_FALSE(report.isOutOfMemory);
  RaiseOutOfMemoryAndMore();
  EXPECT_TRUE(errors.Take().isOutOfMemory);
}

TEST_F(OpenSslErrorTest, ADescriptionNamesAFailedAllocationBelowOtherErrors) {
  const OpenSsl::ErrorScope errors;
  RaiseOutOfMemoryAndMore();
  EXPECT_EQ(errors.Describe("It failed"), "It failed: not enough memory.");
}

TEST_F(OpenSslErrorTest, ADescriptionTakesNoErrorsOfTheHost) {
  ERR_raise(ERR_LIB_X509, ERR_R_INTERNAL_ERROR);
  const unsigned long host = ERR_peek_error();
  {
    const OpenSsl::ErrorScope errors;
    EXPECT_EQ(errors.Describe("It failed"), "It failed.");
    RaiseOutOfMemoryAndMore();
    EXPECT_NE(errors.Describe("It failed"), "It failed.");
  }
  EXPECT_EQ(ERR_get_error(), host);
  EXPECT_EQ(ERR_get_error(), 0U);
}

}  // namespace
}  // namespace Tarnik::Testing
