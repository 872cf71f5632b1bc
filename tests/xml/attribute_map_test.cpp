#include "xml/builders.h"

#include <gmock/gmock.h>

namespace SsoClient {
namespace {

using testing::ElementsAre;
using testing::Pair;

TEST(AttributeMapTest, OrdersNamesByTheirBytes) {
  EXPECT_THAT(ToAttributeMap({{"xmlns:wsu", "U"}, {"wsu:Id", "I"}}),
              ElementsAre(Pair("wsu:Id", "I"), Pair("xmlns:wsu", "U")));
  EXPECT_THAT(ToAttributeMap({{"xmlns:wst14", "b"}, {"xmlns:wst", "a"}, {"Z", "c"}, {"a", "d"}}),
              ElementsAre(Pair("Z", "c"), Pair("a", "d"), Pair("xmlns:wst", "a"),
                          Pair("xmlns:wst14", "b")));
}

TEST(AttributeMapTest, KeepsTheFirstValueOfANameGivenTwice) {
  EXPECT_THAT(ToAttributeMap({{"a", "first"}, {"b", "other"}, {"a", "second"}}),
              ElementsAre(Pair("a", "first"), Pair("b", "other")));
}

TEST(AttributeMapTest, IsEmptyForAnEmptyList) {
  EXPECT_TRUE(ToAttributeMap({}).empty());
}

}  // namespace
}  // namespace SsoClient
