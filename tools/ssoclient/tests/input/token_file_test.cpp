#include "input/token_file.h"

#include <fstream>
#include <iterator>
#include <string>

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "failure.h"
#include "support/temporary_file.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::Testing::TemporaryFolder;

std::string Content(const std::string& path) {
  std::ifstream file(path);
  return {std::istreambuf_iterator<char>(file), {}};
}

mode_t ModeOf(const std::string& path) {
  struct stat status {};
  return stat(path.c_str(), &status) == 0 ? status.st_mode & 07777U : 0;
}

template <class Call>
Failure FailureIn(Call call) {
  try {
    call();
  } catch (const ToolException& exception) {
    return exception.GetFailure();
  }
  Failure none{ExitStatus::kDone, "local", "", ""};
  none.kind.clear();
  return none;
}

TEST(TokenFileTest, IsReadWithoutTheWhiteSpaceAroundIt) {
  const TemporaryFolder folder;
  const std::string path = folder.Write("token", "\n <a b='c'/>\r\n\n");
  chmod(path.c_str(), 0600);
  EXPECT_EQ(ReadTokenFile(path, false).Text(), "<a b='c'/>");
}

TEST(TokenFileTest, OthersMayNeitherReadNorChangeIt) {
  const TemporaryFolder folder;
  const std::string path = folder.Write("token", "<a/>");
  for (const mode_t mode : {0640U, 0604U, 0620U, 0602U, 0644U}) {
    chmod(path.c_str(), mode);
    const Failure failure = FailureIn([&] { ReadTokenFile(path, false); });
    EXPECT_EQ(failure.kind, "token-file-open") << mode;
    EXPECT_EQ(failure.status, ExitStatus::kLocal);
    EXPECT_NE(failure.remedy.find("--allow-open-files"), std::string::npos);
    EXPECT_EQ(ReadTokenFile(path, true).Text(), "<a/>");
  }
  for (const mode_t mode : {0600U, 0400U, 0700U, 0611U}) {
    chmod(path.c_str(), mode);
    EXPECT_EQ(ReadTokenFile(path, false).Text(), "<a/>") << mode;
  }
}

TEST(TokenFileTest, MissingEmptyAndLargeFilesAndFoldersFail) {
  const TemporaryFolder folder;
  EXPECT_EQ(FailureIn([&] { ReadTokenFile(folder.Path() + "/none", true); }).kind, "token-file");
  EXPECT_EQ(FailureIn([&] { ReadTokenFile(folder.Path(), true); }).kind, "token-file");
  const std::string blank = folder.Write("blank", " \n");
  EXPECT_NE(FailureIn([&] { ReadTokenFile(blank, true); }).message.find("contains no token"),
            std::string::npos);
  const std::string large = folder.Write("large", std::string(16 * 1024 * 1024 + 1, 'a'));
  EXPECT_NE(FailureIn([&] { ReadTokenFile(large, true); }).message.find("is larger than"),
            std::string::npos);
  ASSERT_EQ(truncate(large.c_str(), 16 * 1024 * 1024), 0);
  EXPECT_EQ(ReadTokenFile(large, true).Text().size(), std::size_t{16} * 1024 * 1024);
}

TEST(TokenFileTest, IsWrittenForItsOwnerOnlyWhateverTheUmask) {
  const TemporaryFolder folder;
  const std::string path = folder.Path() + "/token";
  for (const mode_t mask : {0U, 0777U}) {
    const mode_t before = umask(mask);
    WriteTokenFile(path, "<a/>");
    umask(before);
    EXPECT_EQ(ModeOf(path), 0600U) << mask;
    EXPECT_EQ(Content(path), "<a/>\n");
  }
}

TEST(TokenFileTest, ReplacesAnOpenFileByAnotherOne) {
  const TemporaryFolder folder;
  const std::string path = folder.Write("token", "old");
  chmod(path.c_str(), 0644);
  std::ifstream reader(path);
  WriteTokenFile(path, "<new/>");
  EXPECT_EQ(Content(path), "<new/>\n");
  EXPECT_EQ(ModeOf(path), 0600U);
  // A reader that has opened the old file still reads all of it.
  EXPECT_EQ(std::string(std::istreambuf_iterator<char>(reader), {}), "old");
}

TEST(TokenFileTest, RefusesLinksAndWhatIsNotAFile) {
  const TemporaryFolder folder;
  const std::string target = folder.Write("target", "old");
  const std::string link = folder.Path() + "/link";
  ASSERT_EQ(symlink(target.c_str(), link.c_str()), 0);
  for (const std::string& path : {link, folder.Path(), std::string("/dev/null")}) {
    EXPECT_EQ(FailureIn([&] { CheckTokenFile(path); }).kind, "output-file") << path;
    EXPECT_EQ(FailureIn([&] { WriteTokenFile(path, "<a/>"); }).kind, "output-file") << path;
  }
  EXPECT_EQ(Content(target), "old");
  EXPECT_EQ(FailureIn([&] { CheckTokenFile(target); }).kind, "");
}

TEST(TokenFileTest, NamesTheFolderThatIsMissing) {
  const TemporaryFolder folder;
  const std::string path = folder.Path() + "/none/token";
  const Failure failure = FailureIn([&] { CheckTokenFile(path); });
  EXPECT_EQ(failure.kind, "output-file");
  EXPECT_NE(failure.message.find(folder.Path() + "/none"), std::string::npos);
  EXPECT_EQ(FailureIn([&] { WriteTokenFile(path, "<a/>"); }).kind, "output-file");
}

}  // namespace
}  // namespace SsoClient::Tool
