#include "plain_text.h"

namespace SsoClient {
namespace {

TEST(PlainTextTest, LeavesTextAsItIs) {
  EXPECT_EQ(PlainText(""), "");
  EXPECT_EQ(PlainText("Ticket expired"), "Ticket expired");
  EXPECT_EQ(PlainText("Jeton expiré"), "Jeton expiré");
}

TEST(PlainTextTest, DropsWhatATextEndsIn) {
  EXPECT_EQ(PlainText(std::string_view("no token \0", 10)), "no token");
  EXPECT_EQ(PlainText(" two lines\r\n\n"), " two lines");
  EXPECT_EQ(PlainText(" \n "), "");
}

TEST(PlainTextTest, StaysInOneLine) {
  EXPECT_EQ(PlainText(std::string_view("a\nb\x1b[1mc\0d\x7f!", 12)), "a?b?[1mc?d?!");
}

TEST(PlainTextTest, IsBounded) {
  EXPECT_EQ(PlainText(std::string(500, 'x')), std::string(500, 'x'));
  EXPECT_EQ(PlainText(std::string(501, 'x')), std::string(500, 'x') + "...");
}

}  // namespace
}  // namespace SsoClient
