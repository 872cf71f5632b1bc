#include <typeinfo>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_exception.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;

template <class Tested>
class SSLExceptionTest : public testing::Test {};

using Classes =
    testing::Types<SSLException, PeerTrustException, PeerNameException, TruncationException>;
TYPED_TEST_SUITE(SSLExceptionTest, Classes);

TYPED_TEST(SSLExceptionTest, KeepsItsClassWhenClonedAndThrown) {
  const TypeParam error("what happened");
  const auto clone = error.Clone();
  EXPECT_EQ(typeid(*clone), typeid(TypeParam));
  EXPECT_EQ(clone->Message(), "what happened");
  EXPECT_EQ(clone->Where().line(), error.Where().line());
  EXPECT_THROW(clone->Throw(), TypeParam);
  EXPECT_THROW(clone->Throw(), SSLException);
  EXPECT_THROW(clone->Throw(), IOException);
}

}  // namespace
}  // namespace Tarnik::Testing
