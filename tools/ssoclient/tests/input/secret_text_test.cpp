#include "input/secret_text.h"

#include <string>
#include <utility>

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

SecretText Make(const std::string& content) {
  SecretText text;
  text.Append(content.data(), content.size());
  return text;
}

TEST(SecretTextTest, MovingKeepsTheBytesInTheirPlace) {
  SecretText first = Make("short");
  const char* const place = first.Text().data();
  SecretText second = std::move(first);
  EXPECT_EQ(second.Text(), "short");
  EXPECT_EQ(second.Text().data(), place);
}

TEST(SecretTextTest, WhatIsRemovedIsOverwritten) {
  SecretText text = Make("secret and comment");
  const char* const place = text.Text().data();
  text.Truncate(6);
  EXPECT_EQ(text.Text(), "secret");
  EXPECT_EQ(std::string(place + 6, 12), std::string(12, '\0'));
}

TEST(SecretTextTest, TrimmingLeavesNoPartOfTheText) {
  SecretText text = Make("   a secret \n");
  const char* const place = text.Text().data();
  text.Trim();
  EXPECT_EQ(text.Text(), "a secret");
  EXPECT_EQ(text.Text().data(), place);
  EXPECT_EQ(std::string(place + 8, 5), std::string(5, '\0'));
}

TEST(SecretTextTest, GrowsAndKeepsItsContent) {
  const std::string large(100'000, 'x');
  SecretText text = Make("a");
  text.Append(large.data(), large.size());
  EXPECT_EQ(text.Text(), "a" + large);
}

TEST(SecretTextTest, TrimsBothEnds) {
  for (const auto& [before, after] : std::initializer_list<std::pair<std::string, std::string>>{
           {" a b\r\n", "a b"}, {"\t\n", ""}, {"", ""}, {"x", "x"}}) {
    SecretText text = Make(before);
    text.Trim();
    EXPECT_EQ(text.Text(), after);
  }
}

}  // namespace
}  // namespace SsoClient::Tool
