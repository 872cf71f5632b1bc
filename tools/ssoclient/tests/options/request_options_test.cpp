#include "options/request_options.h"

#include <CLI/CLI.hpp>
#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

std::int64_t ParseLifetime(const std::string& text) {
  std::int64_t seconds = 0;
  CLI::App app;
  AddLifetimeOption(app, seconds);
  app.parse(std::vector<std::string>{text, "--lifetime"});
  return seconds;
}

TEST(RequestOptionsTest, ALifetimeIsADuration) {
  EXPECT_EQ(ParseLifetime("3600"), 3600);
  EXPECT_EQ(ParseLifetime("30m"), 1800);
  EXPECT_EQ(ParseLifetime("36500d"), std::int64_t{36500} * 24 * 3600);
}

TEST(RequestOptionsTest, WithoutTheOptionItIsAnHour) {
  std::int64_t seconds = 0;
  CLI::App app;
  AddLifetimeOption(app, seconds);
  app.parse(std::vector<std::string>{});
  EXPECT_EQ(seconds, 3600);
}

TEST(RequestOptionsTest, OtherTextsAreNotLifetimes) {
  for (const char* const text : {"", "0", "0h", "-1", "1.5h", "8 h", "36501d"}) {
    EXPECT_THROW(ParseLifetime(text), CLI::ValidationError) << text;
  }
}

}  // namespace
}  // namespace SsoClient::Tool
