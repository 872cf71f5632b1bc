#include <tarnik/ssl/ssl_exception.h>

#include <gtest/gtest.h>

namespace Tarnik::Ssl {
namespace {

TEST(SSLException, KeepsItsClassWhenClonedAndThrown) {
  const SSLException error("what happened");
  const auto clone = error.Clone();
  EXPECT_EQ(clone->Message(), "what happened");
  EXPECT_EQ(clone->Where().line(), error.Where().line());
  EXPECT_THROW(clone->Throw(), SSLException);
  EXPECT_THROW(clone->Throw(), IOException);
}

}  // namespace
}  // namespace Tarnik::Ssl
