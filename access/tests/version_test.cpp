#include <string>

#include <gtest/gtest.h>

#include <ssoclient/access/version.h>
#include <tarnik/version.h>

namespace SsoClient::Access {

namespace {

TEST(VersionTest, TheLibraryHasTheVersionOfItsHeaders) {
  EXPECT_STREQ(Version(), SSOCLIENT_ACCESS_VERSION);
}

TEST(VersionTest, TheNumbersAreThoseOfTheText) {
  EXPECT_EQ(std::to_string(SSOCLIENT_ACCESS_VERSION_MAJOR) + '.' +
                std::to_string(SSOCLIENT_ACCESS_VERSION_MINOR) + '.' +
                std::to_string(SSOCLIENT_ACCESS_VERSION_PATCH),
            SSOCLIENT_ACCESS_VERSION);
}

TEST(VersionTest, AllLibrariesHaveTheSameVersion) {
  EXPECT_STREQ(Version(), Tarnik::Version());
}

}  // namespace

}  // namespace SsoClient::Access
