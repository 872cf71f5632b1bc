#include "system/file.h"

#include <string>

#include <gtest/gtest.h>
#include <unistd.h>

#include <tarnik/core/exception.h>

#include "support/sensitive_text.h"
#include "support/temporary_file.h"
#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using System::ReadFile;

std::string RefusalOf(const std::string& path) {
  SensitiveText text;
  return ThrownMessage<IOException>([&] { ReadFile("test", path, text); }, "read");
}

TEST(ReadFileTest, ReadsEveryByte) {
  std::string content;
  for (int i = 0; i < 10000; ++i) {
    content.push_back(static_cast<char>(i * 13));
  }
  const TemporaryFile file(content);
  SensitiveText text;
  ReadFile("test", file.Path(), text);
  EXPECT_EQ(text.Text(), content);
}

TEST(ReadFileTest, NamesWhatCannotBeRead) {
  EXPECT_EQ(RefusalOf("/nonexistent/file"),
            "The test file '/nonexistent/file' cannot be read: No such file or directory.");
  EXPECT_EQ(RefusalOf("/"), "The test file '/' cannot be read: Is a directory.");
  EXPECT_EQ(RefusalOf(std::string("/etc/x\0y", 8)), "The path of the test file holds a NUL.");
}

TEST(ReadFileTest, RefusesMoreThan16MiB) {
  const TemporaryFile file("");
  ASSERT_EQ(truncate(file.Path().c_str(), 16 << 20), 0);
  EXPECT_EQ(RefusalOf(file.Path()), "read");
  ASSERT_EQ(truncate(file.Path().c_str(), (16 << 20) + 1), 0);
  EXPECT_EQ(RefusalOf(file.Path()),
            "The test file '" + file.Path() + "' cannot be read: it is longer than 16 MiB.");
}

}  // namespace
}  // namespace Tarnik::Testing
