#include "trust/trust_watch.h"

#include <filesystem>
#include <fstream>
#include <functional>
#include <memory>
#include <string>
#include <utility>

#include <gtest/gtest.h>
#include <sys/stat.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

constexpr auto kLook = TrustWatch::kPeriod;

class TrustWatchTest : public TrustFixture {
 protected:
  // Settled, so that only what the test changes is read.
  void MakeSettled() {
    Make();
    Wait();
  }

  void WriteInPlace(const std::string& name, const std::string& content) const {
    std::ofstream(PathOf(name)) << content;
  }

  // The file is changed before each of the next looks.
  void Look() const { runtime->Advance(kLook); }

  void ExpectFailure(const std::string& text) {
    Wait();
    EXPECT_EQ(Failure(), text);
    EXPECT_EQ(Signers(), Names{"CN=sts-0"});
    ASSERT_EQ(listener->kept.size(), 1U);
    EXPECT_EQ(WithoutRoot(listener->kept[0].failure), text);
    EXPECT_TRUE(listener->replaced.empty());
    runtime->Advance(std::chrono::minutes(1));
    EXPECT_EQ(listener->kept.size(), 1U);
  }

  void ExpectRecovery() {
    Wait();
    EXPECT_EQ(Failure(), "");
    EXPECT_EQ(Signers(), Names{"CN=sts-0"});
    EXPECT_EQ(listener->kept.size(), 1U);
    ASSERT_EQ(listener->replaced.size(), 1U);
    EXPECT_EQ(listener->replaced[0].added, 0U);
    EXPECT_EQ(listener->replaced[0].removed, 0U);
    EXPECT_EQ(listener->replaced[0].signers, 1U);
    EXPECT_EQ(store->Version(), version);
  }

  std::uint64_t version = 0;
};

TEST_F(TrustWatchTest, AddedCertificateCountsAtTheSecondLook) {
  MakeSettled();
  Put("trust/b.pem", Sts(1).Pem());
  Look();
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
  Look();
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
  ASSERT_EQ(listener->replaced.size(), 1U);
  EXPECT_EQ(listener->replaced[0].added, 1U);
  EXPECT_EQ(listener->replaced[0].removed, 0U);
  EXPECT_EQ(listener->replaced[0].signers, 2U);
}

TEST_F(TrustWatchTest, ReplacedAndRemovedCertificatesCount) {
  Put("trust/b.pem", Sts(1).Pem());
  MakeSettled();
  Put("trust/a.pem", Sts(2).Pem());
  Wait();
  EXPECT_EQ(Signers(), (Names{"CN=sts-2", "CN=sts-1"}));
  Remove("trust/b.pem");
  Wait();
  EXPECT_EQ(Signers(), Names{"CN=sts-2"});
  Remove("trust/a.pem");
  Wait();
  EXPECT_EQ(Signers(), Names{});
  EXPECT_EQ(Failure(), "");
  EXPECT_EQ(listener->replaced.size(), 3U);
  EXPECT_TRUE(listener->kept.empty());
}

TEST_F(TrustWatchTest, FilesThatChangeAllTheTimeAreReadAtTheThirdLook) {
  MakeSettled();
  for (int look = 1; look <= 3; ++look) {
    EXPECT_EQ(Signers(), Names{"CN=sts-0"});
    Put("trust/b.pem", Sts(1).Pem() + std::string(static_cast<std::size_t>(look), '\n'));
    Look();
  }
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
}

TEST_F(TrustWatchTest, FilesThatStayTheSameAreNotRead) {
  MakeSettled();
  const auto loadedAt = store->Describe().loadedAt;
  runtime->Advance(std::chrono::minutes(1));
  EXPECT_EQ(store->Describe().loadedAt, loadedAt);
}

TEST_F(TrustWatchTest, ChangeWithoutTraceAfterTheFirstReadingIsSeen) {
  // A change within the resolution of the file system's clock has the same size and times.
  Make();
  const auto loadedAt = store->Describe().loadedAt;
  Look();
  EXPECT_EQ(store->Describe().loadedAt, loadedAt);
  Look();
  EXPECT_NE(store->Describe().loadedAt, loadedAt);
}

TEST_F(TrustWatchTest, ChangeWithoutTraceAfterAReloadIsSeen) {
  MakeSettled();
  store->Reload();
  const auto loadedAt = store->Describe().loadedAt;
  Look();
  Look();
  EXPECT_NE(store->Describe().loadedAt, loadedAt);
}

TEST_F(TrustWatchTest, TouchedFileReplacesNothing) {
  MakeSettled();
  const auto before = store->Version();
  Put("trust/a.pem", Sts(0).Pem());
  Wait();
  EXPECT_EQ(store->Version(), before);
  EXPECT_TRUE(listener->replaced.empty());
}

TEST_F(TrustWatchTest, BrokenFileKeepsTheTrustAndIsReportedOnce) {
  MakeSettled();
  version = store->Version();
  Put("trust/a.pem", "broken");
  Wait();
  ExpectFailure(Failure());
  EXPECT_EQ(Failure().rfind("The trust file '/trust/a.pem' cannot be used: ", 0), 0U);
  Put("trust/a.pem", Sts(0).Pem());
  ExpectRecovery();
}

TEST_F(TrustWatchTest, AnotherFailureIsReportedAgain) {
  MakeSettled();
  Put("trust/a.pem", "broken");
  Wait();
  Put("trust/a.pem", "broken in another way");
  Wait();
  EXPECT_EQ(listener->kept.size(), 2U);
}

TEST_F(TrustWatchTest, FolderInPlaceOfAFileKeepsTheTrust) {
  MakeSettled();
  version = store->Version();
  Remove("trust/a.pem");
  std::filesystem::create_directory(PathOf("trust/a.pem"));
  ExpectFailure("The trust file '/trust/a.pem' cannot be read: it is not a regular file.");
  Remove("trust/a.pem");
  Put("trust/a.pem", Sts(0).Pem());
  ExpectRecovery();
}

TEST_F(TrustWatchTest, PipeInPlaceOfAFileDoesNotBlock) {
  MakeSettled();
  version = store->Version();
  Remove("trust/a.pem");
  ASSERT_EQ(mkfifo(PathOf("trust/a.pem").c_str(), 0600), 0);
  ExpectFailure("The trust file '/trust/a.pem' cannot be read: it is not a regular file.");
  Put("trust/a.pem", Sts(0).Pem());
  ExpectRecovery();
}

TEST_F(TrustWatchTest, LinkToNowhereKeepsTheTrust) {
  MakeSettled();
  version = store->Version();
  Remove("trust/a.pem");
  std::filesystem::create_symlink(PathOf("nowhere"), PathOf("trust/a.pem"));
  ExpectFailure("The trust file '/trust/a.pem' cannot be read: No such file or directory.");
  Put("nowhere", Sts(0).Pem());
  ExpectRecovery();
}

TEST_F(TrustWatchTest, FolderThatIsRenamedAwayKeepsTheTrust) {
  MakeSettled();
  version = store->Version();
  Rename("trust", "away");
  ExpectFailure("The trust file '/trust' cannot be read: No such file or directory.");
  Rename("away", "trust");
  ExpectRecovery();
}

TEST_F(TrustWatchTest, ParentThatIsRenamedAwayKeepsTheTrust) {
  std::filesystem::create_directories(PathOf("outer/inner"));
  Put("outer/inner/a.pem", Sts(0).Pem());
  config.issuers[0].certificatePaths = {PathOf("outer/inner")};
  MakeSettled();
  version = store->Version();
  Rename("outer", "away");
  ExpectFailure("The trust file '/outer/inner' cannot be read: No such file or directory.");
  Rename("away", "outer");
  ExpectRecovery();
}

TEST_F(TrustWatchTest, FolderThatIsReplacedCounts) {
  std::filesystem::create_directory(PathOf("next"));
  Put("next/a.pem", Sts(1).Pem());
  MakeSettled();
  Rename("trust", "away");
  Rename("next", "trust");
  Wait();
  EXPECT_EQ(Signers(), Names{"CN=sts-1"});
  EXPECT_TRUE(listener->kept.empty());
}

TEST_F(TrustWatchTest, LinkThatIsSwappedCounts) {
  // As volumes of Kubernetes: the files are links through a link to a folder, which is replaced.
  for (int i = 0; i < 2; ++i) {
    const std::string folder = "trust/..version" + std::to_string(i);
    std::filesystem::create_directory(PathOf(folder));
    Put(folder + "/a.pem", Sts(static_cast<std::size_t>(i)).Pem());
  }
  std::filesystem::create_directory_symlink("..version0", PathOf("trust/..data"));
  Remove("trust/a.pem");
  std::filesystem::create_symlink("..data/a.pem", PathOf("trust/a.pem"));
  MakeSettled();
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
  std::filesystem::create_directory_symlink("..version1", PathOf("trust/..next"));
  Rename("trust/..next", "trust/..data");
  Wait();
  EXPECT_EQ(Signers(), Names{"CN=sts-1"});
}

TEST_F(TrustWatchTest, HalfWrittenFileIsNeverTrustedInPart) {
  const std::string whole = Sts(1).Pem();
  MakeSettled();
  // Nothing, within the first line, within the text, and within the last line.
  for (const std::size_t length : {std::size_t{0}, std::size_t{5}, std::size_t{28},
                                   std::size_t{200}, whole.size() - 20, whole.size() - 3}) {
    WriteInPlace("trust/b.pem", whole.substr(0, length));
    Wait();
    EXPECT_EQ(Signers(), Names{"CN=sts-0"}) << length;
    EXPECT_NE(Failure(), "") << length;
    WriteInPlace("trust/b.pem", whole);
    Wait();
    EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
    EXPECT_EQ(Failure(), "");
    Remove("trust/b.pem");
    Wait();
  }
}

TEST_F(TrustWatchTest, FileThatIsBeingWrittenIsNotReportedIfItIsDoneInTime) {
  const std::string whole = Sts(1).Pem();
  MakeSettled();
  WriteInPlace("trust/b.pem", whole.substr(0, 200));
  Look();
  WriteInPlace("trust/b.pem", whole);
  Wait();
  EXPECT_TRUE(listener->kept.empty());
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
}

TEST_F(TrustWatchTest, ReloadAndWatchAgree) {
  MakeSettled();
  Put("trust/a.pem", Sts(1).Pem());
  Look();
  Put("trust/a.pem", Sts(2).Pem());
  store->Reload();
  Wait();
  EXPECT_EQ(Signers(), Names{"CN=sts-2"});
  EXPECT_EQ(listener->replaced.size(), 1U);
}

TEST_F(TrustWatchTest, LookWithoutAWorkerIsMadeLater) {
  MakeSettled();
  runtime->RefuseWork(true);
  Put("trust/b.pem", Sts(1).Pem());
  runtime->Advance(std::chrono::seconds(10));
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
  runtime->RefuseWork(false);
  Wait();
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
}

TEST_F(TrustWatchTest, ShortageIsReportedOnceAndPassesWithoutAChange) {
  if (!DescriptorShortage::kIsPossible) {
    GTEST_SKIP() << "needs a build without sanitizers";
  }
  config.issuers[0].certificatePaths = {PathOf("trust/a.pem")};
  MakeSettled();
  Put("trust/a.pem", Sts(1).Pem());
  {
    const DescriptorShortage shortage;
    runtime->Advance(std::chrono::seconds(10));
  }
  EXPECT_EQ(Failure(), "The trust file '/trust/a.pem' cannot be read: Too many open files.");
  EXPECT_EQ(listener->kept.size(), 1U);
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
  Wait();
  EXPECT_EQ(Signers(), Names{"CN=sts-1"});
  EXPECT_EQ(Failure(), "");
}

TEST_F(TrustWatchTest, WithoutATimerTheNextUseTriesAgain) {
  struct WithoutTimers final : Runtime {
    Instant Now() const override { return runtime->Now(); }
    double Draw() override { return runtime->Draw(); }
    void Run(std::function<void()> work) override { runtime->Run(std::move(work)); }
    Tarnik::Ref<Tarnik::System::CancellableItem> RunAt(Instant::Steady time,
                                                       std::function<void()> action) override {
      if (isShort) {
        throw Tarnik::ResourceException("No thread.");
      }
      return runtime->RunAt(time, std::move(action));
    }
    std::shared_ptr<VirtualRuntime> runtime;
    bool isShort = true;
  };
  const auto shortRuntime = std::make_shared<WithoutTimers>();
  shortRuntime->runtime = runtime;
  store = CreateTrustStore(config, shortRuntime);
  EXPECT_EQ(runtime->TimersArmed(), 0U);
  shortRuntime->isShort = false;
  store->Version();
  EXPECT_EQ(runtime->TimersArmed(), 1U);
  // A shortage at the end of a look.
  runtime->Pass(kLook);
  shortRuntime->isShort = true;
  runtime->Settle();
  EXPECT_EQ(runtime->TimersArmed(), 0U);
  shortRuntime->isShort = false;
  Put("trust/b.pem", Sts(1).Pem());
  store->Current();
  Wait();
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
}

TEST_F(TrustWatchTest, OneTimerIsArmed) {
  Make();
  for (int i = 0; i < 20; ++i) {
    store->Current();
    store->Version();
    store->Describe();
    runtime->Advance(std::chrono::milliseconds(99));
    EXPECT_EQ(runtime->TimersArmed(), 1U);
    EXPECT_EQ(runtime->WorkQueued(), 0U);
  }
}

TEST_F(TrustWatchTest, TimerDoesNotKeepTheStore) {
  MakeSettled();
  const std::weak_ptr<TrustStoreImpl> weak = store;
  const std::weak_ptr<TrustListener> weakListener = listener;
  config.listener.reset();
  EXPECT_EQ(weakListener.use_count(), 2);
  store.reset();
  EXPECT_TRUE(weak.expired());
  EXPECT_EQ(weakListener.use_count(), 1);
  EXPECT_EQ(runtime->TimersArmed(), 0U);
}

TEST_F(TrustWatchTest, LookThatIsQueuedDoesNothingAfterTheStore) {
  MakeSettled();
  Put("trust/b.pem", Sts(1).Pem());
  Look();
  runtime->Pass(kLook);
  EXPECT_EQ(runtime->WorkQueued(), 1U);
  store.reset();
  Wait();
  EXPECT_TRUE(listener->replaced.empty());
  EXPECT_EQ(runtime->TimersArmed(), 0U);
}

TEST_F(TrustWatchTest, StoreMayBeReleasedByItsListenerInALook) {
  struct Releasing final : TrustListener {
    void OnTrustReplaced(const TrustRecord&) override { store->reset(); }
    std::shared_ptr<TrustStoreImpl>* store = nullptr;
  };
  const auto releasing = std::make_shared<Releasing>();
  releasing->store = &store;
  config.listener = releasing;
  MakeSettled();
  Put("trust/b.pem", Sts(1).Pem());
  Wait();
  EXPECT_EQ(store, nullptr);
  EXPECT_EQ(runtime->TimersArmed(), 0U);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
