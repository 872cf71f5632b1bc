#include <string>

#include <gtest/gtest.h>

#include <tarnik/text/display_text.h>

namespace Tarnik::Testing {
namespace {

TEST(DisplayTextTest, KeepsPlainText) {
  for (const char* text : {"", "Not Found", "Größe: 3 €", "\xF0\x9F\x94\x91 key", "a\xC2\xA0z"}) {
    EXPECT_EQ(ToDisplayText(text, 256), text);
  }
}

TEST(DisplayTextTest, ReplacesControlCharacters) {
  EXPECT_EQ(ToDisplayText("a\r\nb\tc\x1b[31m\x7f", 256), "a??b?c?[31m?");
  EXPECT_EQ(ToDisplayText(std::string("a\0b", 3), 256), "a?b");
  EXPECT_EQ(ToDisplayText("a\xC2\x9Bz", 256), "a?z");
}

// They would let a part of a line look like another line, or appear at another place.
TEST(DisplayTextTest, ReplacesWhatMovesOtherText) {
  for (const char* text : {"a\u061Cz", "a\u200Ez", "a\u200Fz", "a\u2028z", "a\u2029z", "a\u202Az",
                           "a\u202Ez", "a\u2066z", "a\u2069z"}) {
    EXPECT_EQ(ToDisplayText(text, 256), "a?z");
  }
  for (const char* text : {"a\u061Bz", "a\u061Dz", "a\u200Dz", "a\u2010z", "a\u2027z", "a\u202Fz",
                           "a\u2065z", "a\u206Az"}) {
    EXPECT_EQ(ToDisplayText(text, 256), text);
  }
}

TEST(DisplayTextTest, ReplacesBytesThatAreNotUtf8) {
  EXPECT_EQ(ToDisplayText("Gr\xF6\xDF"
                          "e",
                          256),
            "Gr??e");
  EXPECT_EQ(ToDisplayText("\xC0\x80", 256), "??");            // overlong
  EXPECT_EQ(ToDisplayText("\xE0\x9F\xBF", 256), "???");       // overlong
  EXPECT_EQ(ToDisplayText("\xED\xA0\x80", 256), "???");       // a surrogate
  EXPECT_EQ(ToDisplayText("\xF4\x90\x80\x80", 256), "????");  // above U+10FFFF
  EXPECT_EQ(ToDisplayText("\xE2\x82", 256), "??");            // cut off
  EXPECT_EQ(ToDisplayText("\xE2\x82z", 256), "??z");
}

TEST(DisplayTextTest, CutsLongTextBetweenCharacters) {
  EXPECT_EQ(ToDisplayText(std::string(256, 'x'), 256), std::string(256, 'x'));
  EXPECT_EQ(ToDisplayText(std::string(257, 'x'), 256), std::string(256, 'x') + "...");
  EXPECT_EQ(ToDisplayText("ab\xE2\x82\xAC", 4), "ab...");
  EXPECT_EQ(ToDisplayText("ab\xE2\x82\xAC", 5), "ab\xE2\x82\xAC");
}

}  // namespace
}  // namespace Tarnik::Testing
