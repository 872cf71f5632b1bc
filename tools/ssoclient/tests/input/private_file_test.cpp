#include "input/private_file.h"

#include <string>
#include <string_view>

#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include "failure.h"
#include "support/temporary_file.h"

namespace SsoClient::Tool {
namespace {

using Tarnik::Testing::TemporaryFile;
using Tarnik::Testing::TemporaryFolder;

constexpr uid_t kUser = 1000;
constexpr uid_t kOther = 1001;

struct stat StatusWith(uid_t owner, mode_t mode) {
  struct stat status {};
  status.st_uid = owner;
  status.st_mode = S_IFREG | mode;
  return status;
}

std::string KindOf(const PrivateFile& file) {
  try {
    ReadPrivateFile(file);
  } catch (const ToolException& exception) {
    return exception.GetFailure().kind;
  }
  return "";
}

bool IsKey(std::string_view content) {
  return content == "key";
}

bool IsNoKey(std::string_view content) {
  return !IsKey(content);
}

TEST(ExposureTest, OnlyTheUserAndRootMayOwnAPrivateFile) {
  for (const uid_t user : {kUser, uid_t{0}}) {
    EXPECT_EQ(ExposureOf(StatusWith(user, 0600), user), Exposure::kNone);
    EXPECT_EQ(ExposureOf(StatusWith(0, 0600), user), Exposure::kNone);
    EXPECT_EQ(ExposureOf(StatusWith(kOther, 0600), user), Exposure::kByOwner);
    EXPECT_EQ(ExposureOf(StatusWith(kOther, 0000), user), Exposure::kByOwner);
  }
}

TEST(ExposureTest, GroupAndOthersMayNeitherReadNorWrite) {
  for (const mode_t mode : {0640U, 0620U, 0604U, 0602U, 0666U}) {
    EXPECT_EQ(ExposureOf(StatusWith(kUser, mode), kUser), Exposure::kByMode) << mode;
    EXPECT_EQ(ExposureOf(StatusWith(0, mode), kUser), Exposure::kByMode) << mode;
  }
  for (const mode_t mode : {0400U, 0700U, 0611U}) {
    EXPECT_EQ(ExposureOf(StatusWith(kUser, mode), kUser), Exposure::kNone) << mode;
  }
}

TEST(PrivateFileTest, AFileOfAnotherUserIsRefused) {
  const TemporaryFile file("key");
  const PrivateFile key{.path = file.Path(), .what = "key", .maxBytes = 3};
  EXPECT_EQ(KindOf(key), "");
  if (chown(file.Path().c_str(), kOther, kOther) != 0) {
    GTEST_SKIP() << "only root can give a file away";
  }
  chmod(file.Path().c_str(), 0600);
  EXPECT_EQ(KindOf(key), "key-file-open");
  EXPECT_THROW(CheckPrivateFile(key), ToolException);
  PrivateFile open = key;
  open.mayBeOpen = true;
  EXPECT_EQ(KindOf(open), "");
}

TEST(PrivateFileTest, NoDeviceIsToBeChanged) {
  try {
    ReadPrivateFile({.path = "/dev/null", .what = "key"});
    ADD_FAILURE() << "a device that everybody can write to was accepted";
  } catch (const ToolException& exception) {
    EXPECT_EQ(exception.GetFailure().kind, "key-file-open");
    EXPECT_EQ(exception.GetFailure().remedy.find("chmod"), std::string::npos);
  }
}

TEST(PrivateFileTest, ContentThatIsPublicMayBeOpen) {
  const TemporaryFile file("key");
  chmod(file.Path().c_str(), 0644);
  EXPECT_EQ(KindOf({.path = file.Path(), .what = "key", .maxBytes = 3, .isPublic = IsKey}), "");
  EXPECT_EQ(KindOf({.path = file.Path(), .what = "key", .maxBytes = 3, .isPublic = IsNoKey}),
            "key-file-open");
  EXPECT_EQ(KindOf({.path = file.Path(), .what = "key", .maxBytes = 2, .isPublic = IsKey}),
            "key-file");
}

TEST(PrivateFileTest, APipeIsNotAwaitedByACheck) {
  const TemporaryFolder folder;
  const std::string pipe = folder.Path() + "/pipe";
  ASSERT_EQ(mkfifo(pipe.c_str(), 0600), 0);
  EXPECT_NO_THROW(CheckPrivateFile({.path = pipe, .what = "key"}));
  chmod(pipe.c_str(), 0640);
  EXPECT_THROW(CheckPrivateFile({.path = pipe, .what = "key"}), ToolException);
}

}  // namespace
}  // namespace SsoClient::Tool
