#include "output/text_width.h"

#include <gtest/gtest.h>

namespace SsoClient::Tool {
namespace {

using Lines = std::vector<std::string>;

TEST(TextWidthTest, CountsColumnsAndNotBytes) {
  EXPECT_EQ(DisplayWidth(""), 0U);
  EXPECT_EQ(DisplayWidth("abc"), 3U);
  EXPECT_EQ(DisplayWidth("Émile"), 5U);
  EXPECT_EQ(DisplayWidth("E\u0301mile"), 5U) << "a combining accent takes no column";
  EXPECT_EQ(DisplayWidth("東京"), 4U) << "wide characters take two";
  EXPECT_EQ(DisplayWidth("🔑"), 2U);
  EXPECT_EQ(DisplayWidth("a\xFF\xC3"), 3U) << "bytes outside of UTF-8 take one each";
}

TEST(TextWidthTest, PadsToColumns) {
  EXPECT_EQ(PaddedTo("É", 3), "É  ");
  EXPECT_EQ(PaddedTo("東", 3), "東 ");
  EXPECT_EQ(PaddedTo("abcd", 3), "abcd");
}

TEST(TextWidthTest, WrapsAtSpaces) {
  EXPECT_EQ(WrappedLines("", 10), Lines{""});
  EXPECT_EQ(WrappedLines("one two three", 7), (Lines{"one two", "three"}));
  EXPECT_EQ(WrappedLines("one two three", 8), (Lines{"one two", "three"}));
  EXPECT_EQ(WrappedLines("one  two", 4), (Lines{"one ", "two"}));
  EXPECT_EQ(WrappedLines("one\ntwo", 80), (Lines{"one", "two"}));
}

TEST(TextWidthTest, BreaksWordsThatAreLongerThanALine) {
  EXPECT_EQ(WrappedLines("abcdefgh", 3), (Lines{"abc", "def", "gh"}));
  EXPECT_EQ(WrappedLines("東京都", 5), (Lines{"東京", "都"}));
  EXPECT_EQ(WrappedLines("東", 1), (Lines{"東"})) << "a character is never divided";
}

TEST(TextWidthTest, NoLineIsWiderThanAsked) {
  const std::string text =
      "The certificate 'CN=Émile 東京, O=Example' is abcdefghijklmnopqrstuvwxyz";
  for (std::size_t width = 2; width < 80; ++width) {
    for (const std::string& line : WrappedLines(text, width)) {
      EXPECT_LE(DisplayWidth(line), width) << line;
    }
  }
}

TEST(TextWidthTest, ReadsCodePoints) {
  EXPECT_EQ(CodePointOf("a"), U'a');
  EXPECT_EQ(CodePointOf("é"), U'é');
  EXPECT_EQ(CodePointOf("京"), U'京');
  EXPECT_EQ(CodePointOf("🔑"), U'🔑');
  EXPECT_EQ(FirstCharacterLength("🔑a"), 4U);
  EXPECT_EQ(FirstCharacterLength("\xF0\x9F"), 1U) << "a sequence that is cut off";
}

}  // namespace
}  // namespace SsoClient::Tool
