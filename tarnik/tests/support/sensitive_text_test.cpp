#include "support/sensitive_text.h"

#include <cstddef>
#include <string>

#include <gtest/gtest.h>

namespace Tarnik::Testing {
namespace {

TEST(SensitiveTextTest, KeepsItsBytesWhenItGrows) {
  SensitiveText text;
  std::string expected;
  for (int i = 0; i < 10000; ++i) {
    const std::string piece(static_cast<std::size_t>(i % 7), static_cast<char>('a' + i % 26));
    text.Append(piece);
    expected += piece;
  }
  EXPECT_EQ(text.Text(), expected);
}

TEST(SensitiveTextTest, DropsAPrefix) {
  SensitiveText text;
  text.Append("abcdef");
  text.RemovePrefix(0);
  EXPECT_EQ(text.Text(), "abcdef");
  text.RemovePrefix(2);
  EXPECT_EQ(text.Text(), "cdef");
  text.RemovePrefix(4);
  EXPECT_EQ(text.Text(), "");
}

TEST(SensitiveTextTest, OverwritesItsBytesWhenItIsCleared) {
  SensitiveText text;
  text.Append("a password that is too long to live inside the string object");
  const char* const bytes = text.Text().data();
  const std::size_t size = text.Size();
  text.Clear();
  // A cleared string keeps its memory, so these bytes may still be read.
  ASSERT_EQ(text.Text().data(), bytes);
  ASSERT_GE(text.Text().capacity(), size);
  text.Append(std::string(1, 'x'));
  EXPECT_EQ(std::string(bytes + 2, size - 2).find_first_not_of('\0'), std::string::npos);
}

TEST(SensitiveTextTest, IsEmptyAfterItsBytesAreTaken) {
  SensitiveText text;
  text.Append("token");
  EXPECT_EQ(text.Take(), "token");
  EXPECT_EQ(text.Size(), 0U);
}

}  // namespace
}  // namespace Tarnik::Testing
