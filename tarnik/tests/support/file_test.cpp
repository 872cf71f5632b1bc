#include "system/file.h"

#include <gtest/gtest.h>
#include <unistd.h>

#include <tarnik/core/exception.h>

#include "support/test_pki.h"

namespace Tarnik {
namespace {

using System::ReadFile;

std::string RefusalOf(const std::string& path) {
  try {
    SensitiveText text;
    ReadFile("test", path, text);
  } catch (const IOException& error) {
    return error.Message();
  }
  return "read";
}

TEST(ReadFile, GivesEveryByte) {
  std::string content;
  for (int i = 0; i < 10000; ++i) {
    content.push_back(static_cast<char>(i * 13));
  }
  const Testing::TemporaryFile file(content);
  SensitiveText text;
  ReadFile("test", file.Path(), text);
  EXPECT_EQ(text.Text(), content);
}

TEST(ReadFile, NamesWhatCannotBeRead) {
  EXPECT_EQ(RefusalOf("/nonexistent/file"),
            "The test file '/nonexistent/file' cannot be read: No such file or directory.");
  EXPECT_EQ(RefusalOf("/"), "The test file '/' cannot be read: Is a directory.");
  EXPECT_EQ(RefusalOf(std::string("/etc/x\0y", 8)), "The path of the test file holds a NUL.");
}

TEST(ReadFile, RefusesMoreThan16MiB) {
  const Testing::TemporaryFile file("");
  ASSERT_EQ(truncate(file.Path().c_str(), 16 << 20), 0);
  EXPECT_EQ(RefusalOf(file.Path()), "read");
  ASSERT_EQ(truncate(file.Path().c_str(), (16 << 20) + 1), 0);
  EXPECT_EQ(RefusalOf(file.Path()),
            "The test file '" + file.Path() + "' cannot be read: it is longer than 16 MiB.");
}

}  // namespace
}  // namespace Tarnik
