#include "output/safe_text.h"

#include <sstream>

#include <gtest/gtest.h>
#include <nlohmann/json.hpp>

namespace SsoClient::Tool {
namespace {

std::string Safe(bool isUtf8, const std::string& text) {
  std::ostringstream out;
  std::ostringstream err;
  return SafeText({.out = out, .err = err, .isUtf8 = isUtf8}, text);
}

TEST(SafeTextTest, ControlCharactersBecomeQuestionMarks) {
  EXPECT_EQ(Safe(true, "a\x1b[31mred\r\n\x7f"), "a?[31mred???");
  EXPECT_EQ(Safe(true, "a\u009b31m"), "a?31m") << "the single control that begins a sequence";
  EXPECT_EQ(Safe(true, "a\u202ebc"), "a?bc") << "what changes the direction of text";
  EXPECT_EQ(Safe(true, "a\xff"), "a?");
}

TEST(SafeTextTest, OtherCharactersAreKeptInUtf8Only) {
  EXPECT_EQ(Safe(true, "Émile 東京 🔑"), "Émile 東京 🔑");
  EXPECT_EQ(Safe(false, "Émile 🔑"), "<U+00C9>mile <U+1F511>");
}

TEST(SafeTextTest, LongTextsAreCut) {
  EXPECT_EQ(Safe(true, std::string(4000, 'a')), std::string(4000, 'a'));
  const std::string cut = Safe(true, std::string(100000, 'a'));
  EXPECT_LE(cut.size(), 4003U);
  EXPECT_EQ(cut.substr(cut.size() - 4), "a...");
}

TEST(SafeTextTest, JsonKeepsItsMeaningWithoutUnsafeCharacters) {
  const nlohmann::json json = {{"name", "Émile \u009b\u202e\u2028\x7f\x1b?"}, {"other", "🔑"}};
  const std::string text = SafeJson(json.dump(2));
  EXPECT_EQ(nlohmann::json::parse(text), json);
  EXPECT_NE(text.find("Émile \\u009b\\u202e\\u2028\\u007f\\u001b?"), std::string::npos) << text;
  EXPECT_NE(text.find("🔑"), std::string::npos);
}

TEST(SafeTextTest, JsonEscapesCharactersBeyondTheFirstPlaneInTwoParts) {
  const std::string tag = "\U000E0041";
  const std::string text = SafeJson("\"" + tag + "\"");
  EXPECT_EQ(nlohmann::json::parse(text), nlohmann::json(tag)) << text;
}

}  // namespace
}  // namespace SsoClient::Tool
