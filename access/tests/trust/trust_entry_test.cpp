#include "trust/trust_entry.h"

#include <ctime>
#include <filesystem>
#include <string>

#include <gtest/gtest.h>

#include <tarnik/crypto/crypto_exception.h>

#include "support/test_revocation_lists.h"
#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Tarnik::Crypto::CryptoException;
using Tarnik::Testing::MakeCrl;

/// A store whose folder "lists" contains lists of `TrustCa`.
class TrustEntryTest : public TrustFixture {
 protected:
  TrustEntryTest() {
    std::filesystem::create_directory(PathOf("lists"));
    config.issuers[0].revocationListPaths = {PathOf("lists")};
    config.issuers[0].listSignerPaths = {Put("ca.pem", TrustCa().Pem())};
  }

  const Signer& First() {
    snapshot = store->Current();
    return snapshot->Find(kIssuer)->signers.at(0);
  }

  // A list of `TrustCa`, in DER.
  static std::string ListRevokingSince(const char* time) {
    Tarnik::Testing::RevocationListRecipe recipe;
    recipe.key = TrustCa().key.get();
    recipe.entries = {{Sts(0).ToCertificate()->SerialNumber(), time}};
    recipe.edit = [](X509_CRL* list) {
      X509_CRL_set_issuer_name(list, X509_get_subject_name(TrustCa().certificate.get()));
    };
    const auto der = Tarnik::Testing::MakeRevocationListDer(recipe);
    return {der.begin(), der.end()};
  }

  static constexpr const char* kForeignList =
      "The trust file '/lists/a.crl' cannot be used: No certificate of the entry has signed the "
      "revocation list of 'CN=Authority'.";

  std::shared_ptr<const TrustSnapshot> snapshot;
};

TEST_F(TrustEntryTest, WithoutPathsRevocationIsNotChecked) {
  config.issuers[0].revocationListPaths.clear();
  config.issuers[0].listSignerPaths.clear();
  Make();
  EXPECT_FALSE(First().isRevocationChecked);
  EXPECT_FALSE(First().listUntil);
}

TEST_F(TrustEntryTest, CertificateWhoseKeyCannotBeUsedIsAnError) {
  const auto certificate = Sts(0).ToCertificate();
  std::string der(reinterpret_cast<const char*>(certificate->DerBytes()), certificate->DerLength());
  Put("trust/a.pem", der);
  Make();
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
  // id-ecPublicKey (RFC 5480, section 2.1.1) becomes an identifier that nobody knows.
  const std::size_t place = der.find("\x2a\x86\x48\xce\x3d\x02\x01");
  ASSERT_NE(place, std::string::npos);
  der[place + 6] = '\x7f';
  Put("trust/a.pem", der);
  EXPECT_EQ(WithoutRoot(MessageOf<CryptoException>([this] {
              store->Reload();
            })).rfind("The trust file '/trust/a.pem' cannot be used: ", 0),
            0U);
}

TEST_F(TrustEntryTest, FolderWithoutAListLeavesRevocationUnknown) {
  Make();
  EXPECT_TRUE(First().isRevocationChecked);
  EXPECT_FALSE(First().listFrom);
  EXPECT_FALSE(First().listUntil);
}

TEST_F(TrustEntryTest, ListOfTheIssuerCoversItsCertificates) {
  const std::time_t now = std::time(nullptr);
  Put("lists/a.crl", MakeCrl(TrustCa(), &Sts(1), 100, -200, now));
  Put("trust/b.pem", Sts(1).Pem());
  Make();
  EXPECT_FALSE(First().revokedSince);
  EXPECT_EQ(First().listFrom->GetUtcTime(), (now - 200) * 1'000'000);
  EXPECT_EQ(First().listUntil->GetUtcTime(), (now + 100) * 1'000'000);
  EXPECT_EQ(snapshot->Find(kIssuer)->signers.at(1).revokedSince->GetUtcTime(),
            (now - 200) * 1'000'000);
}

TEST_F(TrustEntryTest, DescriptionSaysWhatTheListsSay) {
  const std::time_t now = std::time(nullptr);
  Put("lists/a.crl", MakeCrl(TrustCa(), &Sts(1), 100, -200, now));
  Put("trust/b.pem", Sts(1).Pem());
  Make();
  const auto description = store->Describe();
  ASSERT_EQ(description.signers.size(), 2U);
  for (const TrustedSigner& signer : description.signers) {
    EXPECT_TRUE(signer.isRevocationChecked);
    ASSERT_TRUE(signer.listUntil);
    EXPECT_EQ(signer.listUntil->GetUtcTime(), (now + 100) * 1'000'000);
  }
  EXPECT_FALSE(description.signers[0].revokedSince);
  ASSERT_TRUE(description.signers[1].revokedSince);
  EXPECT_EQ(description.signers[1].revokedSince->GetUtcTime(), (now - 200) * 1'000'000);
}

TEST_F(TrustEntryTest, ListThatIsAddedCounts) {
  Make();
  Put("lists/a.crl", MakeCrl(TrustCa(), &Sts(0)));
  Wait();
  EXPECT_TRUE(First().revokedSince);
  ASSERT_EQ(listener->replaced.size(), 1U);
  EXPECT_EQ(listener->replaced[0].added, 0U);
  EXPECT_EQ(listener->replaced[0].removed, 0U);
  EXPECT_EQ(listener->replaced[0].revoked, 1U);
  EXPECT_EQ(listener->replaced[0].uncovered, 0U);
}

TEST_F(TrustEntryTest, RecordsCountWhoIsRevokedAndWhoHasNoList) {
  Put("trust/b.pem", Sts(1).Pem());
  Put("lists/a.crl", MakeCrl(TrustCa(), nullptr, -10, -100));
  Make();
  Put("lists/a.crl", MakeCrl(TrustCa(), &Sts(1)));
  store->Reload();
  Put("trust/c.pem", Tarnik::Testing::MakeIdentity({}, nullptr).Pem());
  store->Reload();
  Remove("lists/a.crl");
  store->Reload();
  Put("lists/a.crl", "broken");
  EXPECT_THROW(store->Reload(), CryptoException);
  ASSERT_EQ(listener->replaced.size(), 3U);
  EXPECT_EQ(listener->replaced[0].revoked, 1U);
  EXPECT_EQ(listener->replaced[0].uncovered, 0U);
  EXPECT_EQ(listener->replaced[1].revoked, 1U);
  EXPECT_EQ(listener->replaced[1].uncovered, 1U);
  EXPECT_EQ(listener->replaced[2].revoked, 0U);
  EXPECT_EQ(listener->replaced[2].uncovered, 3U);
  ASSERT_EQ(listener->kept.size(), 1U);
  EXPECT_EQ(listener->kept[0].signers, 3U);
  EXPECT_EQ(listener->kept[0].uncovered, 3U);
}

TEST_F(TrustEntryTest, ListThatIsRemovedNoLongerCovers) {
  Put("lists/a.crl", MakeCrl(TrustCa(), nullptr));
  Make();
  EXPECT_TRUE(First().listUntil);
  Remove("lists/a.crl");
  Wait();
  EXPECT_FALSE(First().listUntil);
  EXPECT_TRUE(First().isRevocationChecked);
}

TEST_F(TrustEntryTest, ListsOutOfDateAndOfTheFutureAreLoaded) {
  Put("lists/a.crl", MakeCrl(TrustCa(), nullptr, -10, -100));
  Make();
  EXPECT_LT(First().listUntil->GetUtcTime(), std::time(nullptr) * 1'000'000);
  Put("lists/a.crl", MakeCrl(TrustCa(), nullptr, 1000, 500));
  Wait();
  EXPECT_GT(First().listFrom->GetUtcTime(), std::time(nullptr) * 1'000'000);
  EXPECT_EQ(Failure(), "");
}

TEST_F(TrustEntryTest, LatestListCounts) {
  Put("lists/a.crl",
      MakeCrl(TrustCa(), &Sts(0), 3600, -100) + MakeCrl(TrustCa(), nullptr, 3600, -200));
  Make();
  EXPECT_TRUE(First().revokedSince);
  Put("lists/b.crl", MakeCrl(TrustCa(), nullptr, 3600, -50));
  Wait();
  EXPECT_FALSE(First().revokedSince);
  const auto until = First().listUntil;
  Put("lists/c.crl", MakeCrl(TrustCa(), &Sts(0), 900, -150));
  Wait();
  EXPECT_EQ(Failure(), "");
  EXPECT_FALSE(First().revokedSince);
  EXPECT_EQ(First().listUntil->GetUtcTime(), until->GetUtcTime());
}

// The new key's later lists need not contain what was issued by the old one.
TEST_F(TrustEntryTest, LatestListOfEachKeyOfTheAuthorityCounts) {
  config.issuers[0].listSignerPaths.push_back(Put("new-ca.pem", StrangeCa().Pem()));
  const std::time_t now = std::time(nullptr);
  const std::string byNewKey = MakeCrl(StrangeCa(), nullptr, 900, -100, now);
  Put("lists/a.crl", MakeCrl(TrustCa(), &Sts(0), 3600, -200, now));
  Put("lists/b.crl", byNewKey);
  Make();
  EXPECT_TRUE(First().revokedSince);
  EXPECT_EQ(First().listFrom->GetUtcTime(), (now - 100) * 1'000'000);
  EXPECT_EQ(First().listUntil->GetUtcTime(), (now + 900) * 1'000'000);
  Put("lists/c.crl", MakeCrl(TrustCa(), nullptr, 500, -100, now));
  Wait();
  EXPECT_FALSE(First().revokedSince);
  EXPECT_EQ(First().listUntil->GetUtcTime(), (now + 500) * 1'000'000);
}

TEST_F(TrustEntryTest, ListsOfOneDateAllCount) {
  const std::time_t now = std::time(nullptr);
  for (const bool isRevokedFirst : {true, false}) {
    const std::string revoking = MakeCrl(TrustCa(), &Sts(0), 900, -100, now);
    const std::string other = MakeCrl(TrustCa(), nullptr, 500, -100, now);
    Put("lists/a.crl", isRevokedFirst ? revoking + other : other + revoking);
    Make();
    EXPECT_TRUE(First().revokedSince);
    EXPECT_EQ(First().listUntil->GetUtcTime(), (now + 500) * 1'000'000);
  }
}

// Of one date, so that neither is later.
TEST_F(TrustEntryTest, EarliestRevocationInListsOfOneDateCounts) {
  for (const bool isEarlierFirst : {true, false}) {
    const std::string earlier = ListRevokingSince("20240101000000Z");
    const std::string later = ListRevokingSince("20240301000000Z");
    Put("lists/a.crl", isEarlierFirst ? earlier : later);
    Put("lists/b.crl", isEarlierFirst ? later : earlier);
    Make();
    EXPECT_EQ(First().revokedSince->ToString(), "2024-01-01T00:00:00.000Z");
  }
}

TEST_F(TrustEntryTest, ListsOfOneDateByTwoKeysOfTheAuthorityAllCount) {
  config.issuers[0].listSignerPaths.push_back(Put("new-ca.pem", StrangeCa().Pem()));
  const std::time_t now = std::time(nullptr);
  for (const long end : {500, 900}) {
    Put("lists/a.crl", MakeCrl(TrustCa(), nullptr, end, -100, now));
    Put("lists/b.crl", MakeCrl(StrangeCa(), nullptr, 1400 - end, -100, now));
    Make();
    EXPECT_EQ(First().listUntil->GetUtcTime(), (now + 500) * 1'000'000);
  }
}

TEST_F(TrustEntryTest, EarliestRevocationByAKeyOfTheAuthorityCounts) {
  config.issuers[0].listSignerPaths.push_back(Put("new-ca.pem", StrangeCa().Pem()));
  const std::time_t now = std::time(nullptr);
  for (const long begin : {-100, -200}) {
    Put("lists/a.crl", MakeCrl(TrustCa(), &Sts(0), 900, begin, now));
    Put("lists/b.crl", MakeCrl(StrangeCa(), &Sts(0), 900, -300 - begin, now));
    Make();
    EXPECT_EQ(First().revokedSince->GetUtcTime(), (now - 200) * 1'000'000);
  }
}

TEST_F(TrustEntryTest, ListOfAStrangerWithTheSameNameIsAnError) {
  Put("lists/a.crl", MakeCrl(StrangeCa(), &Sts(1)));
  EXPECT_EQ(WithoutRoot(MessageOf<CryptoException>([this] { Make(); })), kForeignList);
  Put("lists/a.crl", MakeCrl(TrustCa(), &Sts(1)));
  Make();
  Put("lists/a.crl", MakeCrl(StrangeCa(), nullptr));
  Wait();
  EXPECT_EQ(Failure(), kForeignList);
  EXPECT_TRUE(First().listUntil);
  EXPECT_EQ(listener->kept.size(), 1U);
}

TEST_F(TrustEntryTest, ListOfAnotherIssuerIsAnErrorUnlessItsSignerIsGiven) {
  const Identity other = Tarnik::Testing::MakeCa("Other");
  Put("lists/a.crl", MakeCrl(other, nullptr));
  EXPECT_EQ(WithoutRoot(MessageOf<CryptoException>([this] { Make(); })),
            "The trust file '/lists/a.crl' cannot be used: No certificate of the entry has signed "
            "the revocation list of 'CN=Other'.");
  config.issuers[0].listSignerPaths.push_back(Put("other.pem", other.Pem()));
  Make();
  EXPECT_FALSE(First().listUntil);
}

TEST_F(TrustEntryTest, ListWithoutAnyListSignerIsAnErrorThatSaysSo) {
  config.issuers[0].listSignerPaths.clear();
  Put("lists/a.crl", MakeCrl(TrustCa(), nullptr));
  EXPECT_EQ(WithoutRoot(MessageOf<CryptoException>([this] { Make(); })),
            std::string(kForeignList) + " The entry has no list signers.");
}

TEST_F(TrustEntryTest, TrustedCertificateMaySignItsOwnList) {
  const Identity own = Tarnik::Testing::MakeIdentity({}, nullptr);
  Put("trust/a.pem", own.Pem());
  Put("lists/a.crl", MakeCrl(own, nullptr));
  Make();
  EXPECT_TRUE(First().listUntil);
}

TEST_F(TrustEntryTest, SignersOfListsAreNotTrusted) {
  Make();
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
}

TEST_F(TrustEntryTest, FileOfListsWithoutAListIsAnError) {
  Put("lists/a.pem", Sts(0).Pem());
  EXPECT_EQ(WithoutRoot(MessageOf<CryptoException>([this] {
              Make();
            })).rfind("The trust file '/lists/a.pem' cannot be used: ", 0),
            0U);
}

TEST_F(TrustEntryTest, HalfAListIsAnError) {
  const std::string list = MakeCrl(TrustCa(), &Sts(0));
  Put("lists/a.crl", list);
  Make();
  for (const std::size_t length :
       {std::size_t{0}, std::size_t{4}, std::size_t{100}, list.size() - 20}) {
    Put("lists/a.crl", list.substr(0, length));
    EXPECT_THROW(store->Reload(), CryptoException) << length;
    EXPECT_TRUE(First().revokedSince);
  }
}

}  // namespace

}  // namespace SsoClient::Access::Testing
