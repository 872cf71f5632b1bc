#include <memory>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/system/cancellable_item.h>

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::System;

TEST(CancellableItemTest, RunsItsFunctionAtEachCancelAndReturnsItsResult) {
  int calls = 0;
  const auto item = CreateCancellableItem([&calls] { return ++calls == 1; });
  EXPECT_EQ(calls, 0);
  EXPECT_TRUE(item->Cancel());
  EXPECT_FALSE(item->Cancel());
  EXPECT_EQ(calls, 2);
}

TEST(CancellableItemTest, RefusesAnEmptyFunction) {
  EXPECT_THROW(CreateCancellableItem({}), InvalidArgumentException);
}

TEST(CancellableItemTest, ReleasesWhatItsFunctionHolds) {
  auto held = std::make_shared<int>(1);
  auto item = CreateCancellableItem([held] { return *held == 1; });
  EXPECT_EQ(held.use_count(), 2);
  item = nullptr;
  EXPECT_EQ(held.use_count(), 1);
}

}  // namespace
}  // namespace Tarnik::Testing
