#include "secret_text.h"

#include <gtest/gtest.h>

namespace SsoClient::Access {

namespace {

std::string Escaped(const std::string& text) {
  std::string escaped;
  for (const char character : text) {
    switch (character) {
      case '&':
        escaped += "&amp;";
        break;
      case '<':
        escaped += "&lt;";
        break;
      case '>':
        escaped += "&gt;";
        break;
      case '"':
        escaped += "&quot;";
        break;
      case '\'':
        escaped += "&apos;";
        break;
      default:
        escaped += character;
    }
  }
  return escaped;
}

std::string Repeated(const std::string& text, std::size_t size) {
  std::string repeated;
  while (repeated.size() < size) {
    repeated += text;
  }
  repeated.resize(size);
  return repeated;
}

TEST(SecretTextTest, EachOccurrenceIsHidden) {
  EXPECT_EQ(HideSecret("no user 'hunter2', hunter2", "hunter2"), "no user '***', ***");
  EXPECT_EQ(HideSecret("no user", "hunter2"), "no user");
  EXPECT_EQ(HideSecret("", "hunter2"), "");
  EXPECT_EQ(HideSecret("any text", ""), "any text");
}

TEST(SecretTextTest, OccurrencesThatOverlapAreHiddenTogether) {
  EXPECT_EQ(HideSecret("x ababa y", "aba"), "x *** y");
  EXPECT_EQ(HideSecret("aaaa", "aa"), "***");
}

TEST(SecretTextTest, MaskDoesNotContainTheSecret) {
  EXPECT_EQ(HideSecret("a*b", "*"), "a###b");
  EXPECT_EQ(HideSecret("a*#b*#", "*#"), "a---b---");
  const std::string allMasks = "*#-_=+~.0";
  EXPECT_EQ(HideSecret("before " + allMasks + " after", allMasks), "before ");
}

TEST(SecretTextTest, PasswordsOfAllSizes) {
  for (const std::size_t size : {1U, 2U, 3U, 7U, 64U, 1000U, 1001U, 4096U, 65536U}) {
    const std::string secret = Repeated("p&<\"'>\xC3\xA4 w0rd\\n;#x3", size);
    for (const std::string& form : {secret, Escaped(secret), Escaped(Escaped(secret))}) {
      const std::string shown = HideSecret("Failed: [" + form + "] (" + form + ")", secret);
      EXPECT_EQ(shown.find(secret), std::string::npos) << size;
      if (size > 1) {
        EXPECT_EQ(shown, "Failed: [***] (***)") << size;
      }
    }
  }
}

TEST(SecretTextTest, EscapesOfEachKind) {
  const std::string secret = "a<b&\xC3\xA9\xE2\x82\xAC\xF0\x9F\x94\x91";
  for (const char* form :
       {"a&lt;b&amp;\xC3\xA9\xE2\x82\xAC\xF0\x9F\x94\x91", "a&#60;b&#38;&#233;&#8364;&#128273;",
        "a&#x3C;b&#x26;&#xe9;&#X20AC;&#x1F511;", "&#97;&#x0003c;&#98;&#038;&#233;&#8364;&#128273;",
        "a&amp;lt;b&amp;amp;&amp;#233;&amp;#8364;&amp;#128273;"}) {
    EXPECT_EQ(HideSecret(std::string("[") + form + "]", secret), "[***]") << form;
  }
}

TEST(SecretTextTest, SecretThatLooksEscapedItself) {
  EXPECT_EQ(HideSecret("[&lt;&amp;]", "&lt;&amp;"), "[***]");
  EXPECT_EQ(HideSecret("[&amp;lt;x]", "&lt;x"), "[***]");
  EXPECT_EQ(HideSecret("&lt;", "lt;"), "&***");
}

TEST(SecretTextTest, BlanksAndControlCharactersMayBeReplaced) {
  EXPECT_EQ(HideSecret("[one?two?three]", "one\ttwo\nthree"), "[***]");
  EXPECT_EQ(HideSecret("[one two three]", "one\ttwo\nthree"), "[***]");
  // As the client shows bytes that are not UTF-8.
  EXPECT_EQ(HideSecret("[pass?word]", "pass\xFFword"), "[***]");
}

TEST(SecretTextTest, BeginningOfTheSecretAtTheEndOfATextThatWasCut) {
  EXPECT_EQ(HideSecret("Server returned error: 503 hunt", "hunter2"),
            "Server returned error: 503 ***");
  EXPECT_EQ(HideSecret("Server returned error: 503 hunte...", "hunter2"),
            "Server returned error: 503 ***...");
  EXPECT_EQ(HideSecret("the end of a hun", "hunter2"), "the end of a hun");
}

TEST(SecretTextTest, LongTextsAreCut) {
  const std::string text = std::string(4096, 'a') + std::string(1000000, 'b') + "hunter2";
  const std::string shown = HideSecret(text, "hunter2");
  EXPECT_EQ(shown.substr(0, 4096), std::string(4096, 'a'));
  EXPECT_LT(shown.size(), 5000U);
  EXPECT_EQ(HideSecret(std::string(4000, 'a') + Repeated("secret", 9000), Repeated("secret", 9000)),
            std::string(4000, 'a') + "***");
}

TEST(SecretTextTest, RecordsAreShortAndWithoutControlCharacters) {
  EXPECT_EQ(ToRecordText("a\nb"), "a?b");
  EXPECT_EQ(ToRecordText(std::string(1000, 'a')), std::string(1000, 'a'));
  EXPECT_EQ(ToRecordText(std::string(1001, 'a')), std::string(997, 'a') + "...");
}

TEST(SecretTextTest, ReferencesThatAreNoneAreTakenAsTheyAre) {
  for (const char* text : {"&", "&;", "&#;", "&#x;", "&#x110000;", "&#99999999999;", "&nosuch;",
                           "&amp", "& amp;", "&#12a;"}) {
    EXPECT_EQ(HideSecret(text, "hunter2"), text);
    EXPECT_EQ(HideSecret(std::string(text) + "hunter2", "hunter2"), std::string(text) + "***");
  }
}

}  // namespace

}  // namespace SsoClient::Access
