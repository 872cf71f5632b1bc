#include <typeinfo>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/http/http_exception.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Http;

template <class Tested>
class HttpExceptionTest : public testing::Test {};

using Classes = testing::Types<HttpException, CutOffException>;
TYPED_TEST_SUITE(HttpExceptionTest, Classes);

TYPED_TEST(HttpExceptionTest, KeepsItsClassWhenClonedAndThrown) {
  const TypeParam error("what happened");
  const auto clone = error.Clone();
  EXPECT_EQ(typeid(*clone), typeid(TypeParam));
  EXPECT_EQ(clone->Message(), "what happened");
  EXPECT_EQ(clone->Where().line(), error.Where().line());
  EXPECT_THROW(clone->Throw(), TypeParam);
  EXPECT_THROW(clone->Throw(), HttpException);
  EXPECT_THROW(clone->Throw(), IOException);
}

}  // namespace
}  // namespace Tarnik::Testing
