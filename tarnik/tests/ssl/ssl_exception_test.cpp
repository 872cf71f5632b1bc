#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_exception.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;

TEST(SSLExceptionTest, KeepsItsClassWhenClonedAndThrown) {
  const SSLException error("what happened");
  const auto clone = error.Clone();
  EXPECT_EQ(clone->Message(), "what happened");
  EXPECT_EQ(clone->Where().line(), error.Where().line());
  EXPECT_THROW(clone->Throw(), SSLException);
  EXPECT_THROW(clone->Throw(), IOException);
}

}  // namespace
}  // namespace Tarnik::Testing
