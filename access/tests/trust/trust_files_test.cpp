#include "trust/trust_files.h"

#include <cstdint>
#include <filesystem>
#include <fstream>
#include <string>

#include <fcntl.h>
#include <gtest/gtest.h>
#include <sys/stat.h>

#include <tarnik/core/exception.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Tarnik::IOException;

class TrustFilesTest : public TrustFixture {
 protected:
  TrustFilesTest() { Remove("trust/a.pem"); }

  Names Paths(const std::vector<FileContent>& contents) const {
    Names paths;
    for (const FileContent& content : contents) {
      paths.push_back(WithoutRoot(content.path));
    }
    return paths;
  }

  TrustContents Read() const { return ReadFiles(ListFiles(config.issuers)); }

  // Reads while files change: `change` is called before the listing with its number, from 0.
  template <class Change>
  TrustContents ReadWhile(const Change& change) {
    int listings = 0;
    TrustListing listing;
    return ReadUnchanged(
        [&] {
          change(listings++);
          return ListFiles(config.issuers);
        },
        listing);
  }

  std::string Refusal() const {
    return WithoutRoot(MessageOf<IOException>([this] { Read(); }));
  }

  std::uint64_t ChangeTimeOf(const std::string& name) const {
    struct stat found {};
    stat(PathOf(name).c_str(), &found);
    return static_cast<std::uint64_t>(found.st_ctim.tv_sec) * 1'000'000'000 +
           static_cast<std::uint64_t>(found.st_ctim.tv_nsec);
  }
  void SetModified(const std::string& name, std::time_t seconds) const {
    const timespec time{seconds, 1};
    const timespec times[] = {time, time};
    ASSERT_EQ(utimensat(AT_FDCWD, PathOf(name).c_str(), times, 0), 0);
  }

  static constexpr std::size_t kLargest = kLargestTrustFile;
};

TEST_F(TrustFilesTest, FilesOfAFolderCountByTheirNamesInOrder) {
  for (const std::string name : {"c.pem", "a.crt", "B.cer", ".hidden.pem", "key.txt", "d.crl",
                                 "e.PEM", "f.pem.new", ".pem"}) {
    Put("trust/" + name, name);
  }
  config.issuers[0].revocationListPaths = {PathOf("trust")};
  config.issuers[0].listSignerPaths = {PathOf("trust")};
  const TrustContents contents = Read();
  const Names expected{"/trust/B.cer", "/trust/a.crt", "/trust/c.pem"};
  EXPECT_EQ(Paths(contents.entries[0].certificates), expected);
  EXPECT_EQ(Paths(contents.entries[0].listSigners), expected);
  EXPECT_EQ(Paths(contents.entries[0].lists),
            (Names{"/trust/B.cer", "/trust/a.crt", "/trust/c.pem", "/trust/d.crl"}));
  EXPECT_EQ(contents.entries[0].certificates[1].bytes, "a.crt");
}

TEST_F(TrustFilesTest, FileThatIsNamedMayHaveAnyName) {
  config.issuers[0].certificatePaths = {Put(".any", "content")};
  EXPECT_EQ(Paths(Read().entries[0].certificates), Names{"/.any"});
}

TEST_F(TrustFilesTest, FoldersInAFolderAreNotSearched) {
  std::filesystem::create_directory(PathOf("trust/inner"));
  Put("trust/inner/a.pem", "a");
  EXPECT_EQ(Paths(Read().entries[0].certificates), Names{});
}

TEST_F(TrustFilesTest, LargestFileIsReadAndALongerOneIsNot) {
  Put("trust/a.pem", std::string(kLargest, 'x'));
  EXPECT_EQ(Read().entries[0].certificates[0].bytes.size(), kLargest);
  Put("trust/a.pem", std::string(kLargest + 1, 'x'));
  EXPECT_EQ(Refusal(), "The trust file '/trust/a.pem' cannot be read: it is longer than 16 MiB.");
}

TEST_F(TrustFilesTest, FileThatHasGrownSinceItWasListedIsNotReadWithoutLimit) {
  Put("trust/a.pem", "short");
  const TrustListing listing = ListFiles(config.issuers);
  Put("trust/a.pem", std::string(kLargest + 1, 'x'));
  EXPECT_EQ(WithoutRoot(MessageOf<IOException>([&] { ReadFiles(listing); })),
            "The trust file '/trust/a.pem' cannot be read: it is longer than 16 MiB.");
}

TEST_F(TrustFilesTest, WhatIsNotAFileIsRefusedWithoutWaiting) {
  Put("trust/a.pem", "a");
  const TrustListing listing = ListFiles(config.issuers);
  Remove("trust/a.pem");
  ASSERT_EQ(mkfifo(PathOf("trust/a.pem").c_str(), 0600), 0);
  const std::string refusal =
      "The trust file '/trust/a.pem' cannot be read: it is not a regular file.";
  EXPECT_EQ(Refusal(), refusal);
  // Also when it has taken the place of the file that was listed.
  EXPECT_EQ(WithoutRoot(MessageOf<IOException>([&] { ReadFiles(listing); })), refusal);
  config.issuers[0].certificatePaths = {"/dev/null"};
  EXPECT_EQ(Refusal(), "The trust file '/dev/null' cannot be read: it is not a regular file.");
}

TEST_F(TrustFilesTest, WhatTheListingSaysIsRefusedBeforeAFileIsRead) {
  Put("trust/a.pem", "a");
  config.issuers[0].certificatePaths.push_back(PathOf("missing"));
  const TrustListing listing = ListFiles(config.issuers);
  Remove("trust/a.pem");
  EXPECT_EQ(WithoutRoot(MessageOf<IOException>([&] { ReadFiles(listing); })),
            "The trust file '/missing' cannot be read: No such file or directory.");
}

TEST_F(TrustFilesTest, WhatIsListedAsNoFileIsRefusedBeforeAFileIsRead) {
  Put("trust/a.pem", "a");
  std::filesystem::create_directory(PathOf("trust/b.pem"));
  const TrustListing listing = ListFiles(config.issuers);
  Remove("trust/a.pem");
  EXPECT_EQ(WithoutRoot(MessageOf<IOException>([&] { ReadFiles(listing); })),
            "The trust file '/trust/b.pem' cannot be read: it is not a regular file.");
}

// As when a link leads elsewhere while files are read, and back before they are listed again.
TEST_F(TrustFilesTest, FileThatIsNotTheListedOneIsNoticed) {
  for (const std::string folder : {"first", "second"}) {
    std::filesystem::create_directory(PathOf(folder));
    Put(folder + "/a.pem", "a");
  }
  std::filesystem::create_directory_symlink(PathOf("first"), PathOf("link"));
  config.issuers[0].certificatePaths = {PathOf("link")};
  const TrustListing listing = ListFiles(config.issuers);
  EXPECT_TRUE(ReadFiles(listing).isOfListing);
  std::filesystem::create_directory_symlink(PathOf("second"), PathOf("next"));
  Rename("next", "link");
  EXPECT_FALSE(ReadFiles(listing).isOfListing);
  EXPECT_TRUE(Read().isOfListing);
}

TEST_F(TrustFilesTest, FilesThatChangeWhileTheyAreReadAreReadAgain) {
  Put("trust/a.pem", "a");
  const TrustContents contents = ReadWhile([this](int listing) {
    if (listing == 1) {
      Put("trust/b.pem", "b");
    }
  });
  EXPECT_EQ(Paths(contents.entries[0].certificates), (Names{"/trust/a.pem", "/trust/b.pem"}));
}

TEST_F(TrustFilesTest, FileThatIsGoneWhenItIsReadIsNoErrorIfItIsNoLongerListed) {
  Put("trust/a.pem", "a");
  Put("trust/b.pem", "b");
  TrustListing listing;
  const TrustContents contents = ReadUnchanged(
      [this] {
        TrustListing listed = ListFiles(config.issuers);
        std::filesystem::remove(PathOf("trust/a.pem"));
        return listed;
      },
      listing);
  EXPECT_EQ(Paths(contents.entries[0].certificates), Names{"/trust/b.pem"});
}

TEST_F(TrustFilesTest, FilesThatNeverStayTheSameAreAnError) {
  int last = 0;
  EXPECT_EQ(MessageOf<IOException>([&] {
              ReadWhile([&](int listing) {
                last = listing;
                Put("trust/a.pem", std::string(static_cast<std::size_t>(listing), 'a'));
              });
            }),
            "The trust files change faster than they can be read.");
  EXPECT_EQ(last, 5);
}

TEST_F(TrustFilesTest, TooFewDescriptorsAreAShortage) {
  if (!DescriptorShortage::kIsPossible) {
    GTEST_SKIP() << "needs a build without sanitizers";
  }
  Put("trust/a.pem", "a");
  const TrustListing listing = ListFiles(config.issuers);
  std::string message;
  {
    const DescriptorShortage shortage;
    message = MessageOf<Tarnik::ResourceException>([&] { ReadFiles(listing); });
  }
  EXPECT_EQ(WithoutRoot(message),
            "The trust file '/trust/a.pem' cannot be read: Too many open files.");
  EXPECT_EQ(ReadFiles(listing).entries.size(), 1U);
}

TEST_F(TrustFilesTest, ListingsDifferWhenAnythingHasChanged) {
  Put("trust/a.pem", "a");
  const TrustListing before = ListFiles(config.issuers);
  EXPECT_EQ(ListFiles(config.issuers), before);
  // The same content and size, in another file.
  Put("trust/a.pem", "a");
  EXPECT_NE(ListFiles(config.issuers), before);
  const TrustListing replaced = ListFiles(config.issuers);
  chmod(PathOf("trust/a.pem").c_str(), 0640);
  EXPECT_NE(ListFiles(config.issuers), replaced);
}

TEST_F(TrustFilesTest, TimeThatIsSetBackDoesNotHideAChange) {
  Put("trust/a.pem", "a");
  const TrustListing before = ListFiles(config.issuers);
  const auto time = std::filesystem::last_write_time(PathOf("trust/a.pem"));
  // Until the file system's clock has advanced.
  do {
    std::ofstream(PathOf("trust/a.pem")) << "b";
    std::filesystem::last_write_time(PathOf("trust/a.pem"), time);
  } while (ChangeTimeOf("trust/a.pem") == before.entries[0].certificates[0].files[0].changed);
  EXPECT_NE(ListFiles(config.issuers), before);
}

// In nanoseconds, more than 64 bits can count.
TEST_F(TrustFilesTest, TimesOfFilesMayBeFarAway) {
  constexpr std::time_t kYear2445 = 15'000'000'000;
  Put("trust/a.pem", "a");
  SetModified("trust/a.pem", kYear2445);
  const TrustListing before = ListFiles(config.issuers);
  EXPECT_EQ(ReadFiles(before).entries[0].certificates[0].bytes, "a");
  SetModified("trust/a.pem", kYear2445 - 1);
  EXPECT_NE(ListFiles(config.issuers), before);
}

TEST_F(TrustFilesTest, FilesThatDoNotCountDoNotChangeTheListing) {
  Put("trust/a.pem", "a");
  const TrustListing before = ListFiles(config.issuers);
  Put("trust/.a.pem.new", "b");
  EXPECT_EQ(ListFiles(config.issuers), before);
}

TEST_F(TrustFilesTest, DigestsDifferByPlaceNameAndContent) {
  Put("trust/a.pem", "a");
  const std::string digest = Read().digest;
  EXPECT_EQ(Read().digest, digest);
  Put("trust/a.pem", "b");
  EXPECT_NE(Read().digest, digest);
  Rename("trust/a.pem", "trust/b.pem");
  Put("trust/b.pem", "a");
  EXPECT_NE(Read().digest, digest);
  Rename("trust/b.pem", "trust/a.pem");
  EXPECT_EQ(Read().digest, digest);
  config.issuers[0].listSignerPaths.swap(config.issuers[0].certificatePaths);
  EXPECT_NE(Read().digest, digest);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
