#include <filesystem>
#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Tarnik::InvalidArgumentException;
using Tarnik::IOException;
using Tarnik::Crypto::CryptoException;

class TrustStoreTest : public TrustFixture {
 protected:
  template <class E>
  std::string Refusal() {
    return WithoutRoot(MessageOf<E>([this] { Make(); }));
  }
};

TEST_F(TrustStoreTest, FilesOfAFolderAreTrusted) {
  Put("trust/b.crt", Sts(1).Pem());
  Make();
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
  EXPECT_EQ(Signers("https://other.example"), Names{});
}

TEST_F(TrustStoreTest, CertificatesAndFilesAreTrustedTogether) {
  config.issuers[0].certificates = {Sts(2).ToCertificate()};
  config.issuers[0].certificatePaths = {Put("one.txt", Sts(1).Pem() + Sts(0).Pem())};
  Make();
  EXPECT_EQ(Signers(), (Names{"CN=sts-2", "CN=sts-1", "CN=sts-0"}));
}

TEST_F(TrustStoreTest, StoreWithoutCertificatesIsRefused) {
  Remove("trust/a.pem");
  EXPECT_EQ(Refusal<InvalidArgumentException>(),
            "The trust store has no certificate. Its entries contain none in '/trust' (issuers[0], "
            "'https://sts.example').");
  Put("trust/a.pem", Sts(0).Pem());
  Make();
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
}

TEST_F(TrustStoreTest, BrokenConfigurationIsRefusedBeforeFilesAreRead) {
  config.issuers.clear();
  EXPECT_EQ(Refusal<InvalidArgumentException>(), "The trust store has no entry.");
}

TEST_F(TrustStoreTest, PathThatDoesNotExistIsNamed) {
  config.issuers[0].certificatePaths.push_back(PathOf("missing"));
  EXPECT_EQ(Refusal<IOException>(),
            "The trust file '/missing' cannot be read: No such file or directory.");
}

TEST_F(TrustStoreTest, FileThatCannotBeDecodedIsNamed) {
  Put("trust/b.pem", "no certificate");
  EXPECT_EQ(Refusal<CryptoException>().rfind("The trust file '/trust/b.pem' cannot be used: ", 0),
            0U);
}

TEST_F(TrustStoreTest, RelativePathsStayTheSameInAnotherFolder) {
  const auto before = std::filesystem::current_path();
  std::filesystem::current_path(root.Path());
  config.issuers[0].certificatePaths = {"trust"};
  Make();
  std::filesystem::current_path(before);
  Put("trust/b.pem", Sts(1).Pem());
  store->Reload();
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
}

TEST_F(TrustStoreTest, ReloadCountsAtOnce) {
  config.isWatching = false;
  Make();
  const auto before = store->Current();
  const auto version = store->Version();
  EXPECT_EQ(version, before->Version());
  Put("trust/a.pem", Sts(1).Pem());
  store->Reload();
  EXPECT_EQ(Signers(), Names{"CN=sts-1"});
  EXPECT_NE(store->Version(), version);
  EXPECT_EQ(store->Version(), store->Current()->Version());
  EXPECT_EQ(SignersOf(*before), Names{"CN=sts-0"});
  ASSERT_EQ(listener->replaced.size(), 1U);
  EXPECT_EQ(listener->replaced[0].store, "orders");
  EXPECT_EQ(listener->replaced[0].failure, "");
  EXPECT_EQ(listener->replaced[0].added, 1U);
  EXPECT_EQ(listener->replaced[0].removed, 1U);
  EXPECT_EQ(listener->replaced[0].signers, 1U);
}

TEST_F(TrustStoreTest, ReloadOfTheSameFilesKeepsTheSnapshot) {
  config.isWatching = false;
  Make();
  const auto before = store->Current();
  const auto loadedAt = store->Describe().loadedAt;
  runtime->Advance(std::chrono::seconds(5));
  Put("trust/a.pem", Sts(0).Pem());
  store->Reload();
  EXPECT_EQ(store->Current()->Version(), before->Version());
  EXPECT_TRUE(listener->replaced.empty());
  EXPECT_EQ(store->Describe().loadedAt.GetUtcTime() - loadedAt.GetUtcTime(), 5'000'000);
}

TEST_F(TrustStoreTest, ReloadThatFailsKeepsTheTrust) {
  config.isWatching = false;
  Make();
  const auto version = store->Version();
  Put("trust/a.pem", "broken");
  Put("trust/b.pem", Sts(1).Pem());
  EXPECT_THROW(store->Reload(), CryptoException);
  EXPECT_THROW(store->Reload(), CryptoException);
  EXPECT_EQ(store->Version(), version);
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
  EXPECT_NE(Failure().find("/trust/a.pem"), std::string::npos);
  ASSERT_EQ(listener->kept.size(), 1U);
  EXPECT_EQ(WithoutRoot(listener->kept[0].failure), Failure());
  EXPECT_EQ(listener->kept[0].signers, 1U);
  EXPECT_EQ(listener->kept[0].store, "orders");
  Put("trust/a.pem", Sts(2).Pem());
  store->Reload();
  EXPECT_EQ(Signers(), (Names{"CN=sts-2", "CN=sts-1"}));
  EXPECT_EQ(Failure(), "");
}

TEST_F(TrustStoreTest, ReloadAcceptsThatTheLastCertificateIsGone) {
  config.isWatching = false;
  Make();
  Remove("trust/a.pem");
  store->Reload();
  EXPECT_EQ(store->Current()->Find(kIssuer), nullptr);
  EXPECT_TRUE(store->Describe().signers.empty());
  ASSERT_EQ(listener->replaced.size(), 1U);
  EXPECT_EQ(listener->replaced[0].removed, 1U);
  EXPECT_EQ(listener->replaced[0].signers, 0U);
}

TEST_F(TrustStoreTest, IssuerWhoseFolderIsEmptyIsDescribed) {
  config.issuers.resize(2);
  config.issuers[1].issuer = "https://b";
  config.issuers[1].certificatePaths = {PathOf("b")};
  std::filesystem::create_directory(PathOf("b"));
  Make();
  EXPECT_EQ(store->Describe().issuersWithoutSigners, Names{"https://b"});
  Put("b/b.pem", Sts(1).Pem());
  store->Reload();
  EXPECT_EQ(store->Describe().issuersWithoutSigners, Names{});
  Remove("trust/a.pem");
  store->Reload();
  EXPECT_EQ(store->Describe().issuersWithoutSigners, Names{kIssuer});
  Put("b/b.pem", "broken");
  EXPECT_THROW(store->Reload(), CryptoException);
  ASSERT_EQ(listener->replaced.size(), 2U);
  EXPECT_EQ(listener->replaced[0].issuersWithoutSigners, Names{});
  EXPECT_EQ(listener->replaced[1].issuersWithoutSigners, Names{kIssuer});
  ASSERT_EQ(listener->kept.size(), 1U);
  EXPECT_EQ(listener->kept[0].issuersWithoutSigners, Names{kIssuer});
}

TEST_F(TrustStoreTest, DescriptionNamesTheFileOfEachSigner) {
  config.issuers[0].certificates = {Sts(1).ToCertificate()};
  Make();
  const auto description = store->Describe();
  ASSERT_EQ(description.signers.size(), 2U);
  EXPECT_EQ(description.signers[0].path, "");
  EXPECT_EQ(description.signers[1].path, PathOf("trust/a.pem"));
  EXPECT_EQ(description.signers[1].issuer, kIssuer);
  EXPECT_EQ(description.signers[1].certificate->SubjectName(), "CN=sts-0");
  EXPECT_FALSE(description.signers[1].isRevocationChecked);
}

TEST_F(TrustStoreTest, StoreWithoutWatchingHasNoTimer) {
  config.isWatching = false;
  Make();
  store->Describe();
  EXPECT_EQ(runtime->TimersArmed(), 0U);
  Put("trust/b.pem", Sts(1).Pem());
  Wait();
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
}

TEST_F(TrustStoreTest, ListenerMustNotReload) {
  struct Reloading final : TrustListener {
    void OnTrustReplaced(const TrustRecord&) override {
      message = MessageOf<Tarnik::InvalidStateException>([this] { (*store)->Reload(); });
    }
    const std::shared_ptr<TrustStoreImpl>* store = nullptr;
    std::string message;
  };
  const auto reloading = std::make_shared<Reloading>();
  reloading->store = &store;
  config.listener = reloading;
  Make();
  Put("trust/b.pem", Sts(1).Pem());
  store->Reload();
  EXPECT_EQ(reloading->message, "A listener of the trust store must not reload it.");
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
}

TEST_F(TrustStoreTest, ExceptionsOfListenersAreIgnored) {
  struct Throwing final : TrustListener {
    void OnTrustReplaced(const TrustRecord&) override { throw 1; }
    void OnTrustKept(const TrustRecord&) override { throw 2; }
  };
  config.listener = std::make_shared<Throwing>();
  Make();
  Put("trust/b.pem", Sts(1).Pem());
  store->Reload();
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
  Put("trust/b.pem", "");
  EXPECT_THROW(store->Reload(), CryptoException);
}

TEST_F(TrustStoreTest, StoreMayBeReleasedByItsListenerInReload) {
  struct Releasing final : TrustListener {
    void OnTrustReplaced(const TrustRecord&) override { store->reset(); }
    std::shared_ptr<TrustStoreImpl>* store = nullptr;
  };
  const auto releasing = std::make_shared<Releasing>();
  releasing->store = &store;
  config.listener = releasing;
  Make();
  Put("trust/b.pem", Sts(1).Pem());
  store->Reload();
  EXPECT_EQ(store, nullptr);
  EXPECT_EQ(runtime->TimersArmed(), 0U);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
