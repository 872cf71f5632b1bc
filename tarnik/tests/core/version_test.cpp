#include <string>

#include <gtest/gtest.h>

#include <tarnik/version.h>

namespace Tarnik {

namespace {

TEST(VersionTest, TheLibraryHasTheVersionOfItsHeaders) {
  EXPECT_STREQ(Version(), TARNIK_VERSION);
}

TEST(VersionTest, TheNumbersAreThoseOfTheText) {
  EXPECT_EQ(std::to_string(TARNIK_VERSION_MAJOR) + '.' + std::to_string(TARNIK_VERSION_MINOR) +
                '.' + std::to_string(TARNIK_VERSION_PATCH),
            TARNIK_VERSION);
}

}  // namespace

}  // namespace Tarnik
