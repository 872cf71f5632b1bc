#include "trust/trust_builder.h"

#include <algorithm>
#include <filesystem>
#include <set>
#include <string>

#include <gtest/gtest.h>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/crypto_exception.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

constexpr const char* kOther = "https://other.example";

class TrustBuilderTest : public TrustFixture {
 protected:
  static TrustedIssuer EntryOf(const std::string& issuer, std::vector<std::size_t> numbers) {
    TrustedIssuer entry;
    entry.issuer = issuer;
    entry.isForAnyIssuer = issuer.empty();
    for (const std::size_t number : numbers) {
      entry.certificates.push_back(Sts(number).ToCertificate());
    }
    return entry;
  }
};

TEST_F(TrustBuilderTest, EntriesOfOneIssuerAreUsedTogether) {
  config.issuers = {EntryOf(kIssuer, {0}), EntryOf(kOther, {2}), EntryOf(kIssuer, {1})};
  Make();
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-1"}));
  EXPECT_EQ(Signers(kOther), Names{"CN=sts-2"});
  EXPECT_EQ(store->Current()->Find("https://third.example"), nullptr);
}

TEST_F(TrustBuilderTest, SignersOfAnyIssuerFollowThoseOfTheIssuer) {
  config.issuers = {EntryOf("", {3}), EntryOf(kIssuer, {0})};
  Make();
  EXPECT_EQ(Signers(), (Names{"CN=sts-0", "CN=sts-3"}));
  EXPECT_EQ(Signers(kOther), Names{"CN=sts-3"});
  EXPECT_EQ(Signers(""), Names{"CN=sts-3"});
}

TEST_F(TrustBuilderTest, IssuersAreComparedByteForByte) {
  config.issuers = {EntryOf(kIssuer, {0})};
  Make();
  for (const std::string issuer :
       {"https://sts.example/", "https://STS.example", "https://sts", ""}) {
    EXPECT_EQ(Signers(issuer), Names{}) << issuer;
  }
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
}

TEST_F(TrustBuilderTest, NamedIssuerWhoseFolderIsEmptyHasTheSignersOfAny) {
  config.issuers.push_back(EntryOf("", {3}));
  Make();
  Remove("trust/a.pem");
  store->Reload();
  EXPECT_EQ(Signers(), Names{"CN=sts-3"});
}

TEST_F(TrustBuilderTest, CertificateInTwoEntriesIsOneSignerWithTheListsOfBoth) {
  config.issuers.push_back(EntryOf(kIssuer, {0, 0}));
  std::filesystem::create_directory(PathOf("lists"));
  config.issuers[1].revocationListPaths = {PathOf("lists")};
  Make();
  EXPECT_EQ(Signers(), Names{"CN=sts-0"});
  EXPECT_TRUE(store->Current()->Find(kIssuer)->signers[0].isRevocationChecked);
  const auto description = store->Describe();
  ASSERT_EQ(description.signers.size(), 1U);
  EXPECT_EQ(description.signers[0].path, PathOf("trust/a.pem"));
  EXPECT_TRUE(description.signers[0].isRevocationChecked);
}

TEST_F(TrustBuilderTest, ListsOfAnEntryForAnyIssuerCountForTheSameCertificateElsewhere) {
  config.issuers.push_back(EntryOf("", {0}));
  std::filesystem::create_directory(PathOf("lists"));
  config.issuers[1].revocationListPaths = {PathOf("lists")};
  Make();
  EXPECT_TRUE(store->Current()->Find(kIssuer)->signers[0].isRevocationChecked);
  EXPECT_EQ(store->Describe().signers.size(), 2U);
}

TEST_F(TrustBuilderTest, CertificateInTwoEntriesOfAnIssuerCountsOnceInRecords) {
  Put("trust/b.pem", Sts(1).Pem());
  config.issuers.push_back(EntryOf(kIssuer, {1}));
  Make();
  Put("trust/c.pem", Sts(1).Pem() + Sts(2).Pem());
  store->Reload();
  ASSERT_EQ(listener->replaced.size(), 1U);
  EXPECT_EQ(listener->replaced[0].added, 1U);
  EXPECT_EQ(listener->replaced[0].signers, 3U);
}

TEST_F(TrustBuilderTest, CertificateOfTwoIssuersCountsTwiceInRecords) {
  config.issuers.push_back(EntryOf(kOther, {1}));
  Make();
  Put("trust/b.pem", Sts(1).Pem());
  store->Reload();
  ASSERT_EQ(listener->replaced.size(), 1U);
  EXPECT_EQ(listener->replaced[0].added, 1U);
  EXPECT_EQ(listener->replaced[0].signers, 3U);
  EXPECT_EQ(store->Describe().signers.size(), 3U);
  Remove("trust/b.pem");
  store->Reload();
  ASSERT_EQ(listener->replaced.size(), 2U);
  EXPECT_EQ(listener->replaced[1].removed, 1U);
  EXPECT_EQ(listener->replaced[1].signers, 2U);
}

TEST_F(TrustBuilderTest, SignerHasThePeriodAndTheNameOfItsCertificate) {
  Make();
  const auto trust = store->Current();
  const Signer& signer = trust->Find(kIssuer)->signers[0];
  EXPECT_EQ(signer.notBefore, signer.certificate->NotBefore());
  EXPECT_EQ(signer.notAfter, signer.certificate->NotAfter());
  EXPECT_EQ(signer.name, "CN=sts-0 (SHA-256 " +
                             Tarnik::Crypto::FingerprintText(*signer.certificate).substr(0, 23) +
                             "...)");
  EXPECT_NE(signer.resolver->Resolve({}), nullptr);
}

TEST_F(TrustBuilderTest, NamesHaveNoControlCharacters) {
  Tarnik::Testing::IdentityOptions options;
  options.commonName = "bell\x07" + std::string(50, 'x');
  Put("trust/a.pem", Tarnik::Testing::MakeIdentity(options, nullptr).Pem());
  Make();
  const auto trust = store->Current();
  const std::string& name = trust->Find(kIssuer)->signers[0].name;
  EXPECT_EQ(name.find('\x07'), std::string::npos);
}

TEST_F(TrustBuilderTest, VersionsOfAllStoresDiffer) {
  Make();
  const auto first = store->Current();
  Make();
  EXPECT_NE(store->Version(), first->Version());
}

TEST_F(TrustBuilderTest, ThousandCertificatesAreTrusted) {
  constexpr std::size_t kCertificates = 1000;
  const auto certificate = Sts(1).ToCertificate();
  std::string der(reinterpret_cast<const char*>(certificate->DerBytes()), certificate->DerLength());
  // The version, and the tag of the serial number (RFC 5280, section 4.1), whose last bytes differ.
  const std::size_t place = der.find("\xa0\x03\x02\x01\x02\x02");
  ASSERT_NE(place, std::string::npos);
  const std::size_t end = place + 7 + static_cast<unsigned char>(der[place + 6]);
  for (std::size_t i = 0; i < kCertificates; ++i) {
    der[end - 2] = static_cast<char>(i / 256);
    der[end - 1] = static_cast<char>(i % 256);
    root.Write("trust/" + std::to_string(i) + ".cer", der);
  }
  Make();
  EXPECT_EQ(Signers().size(), kCertificates + 1);
  const auto trust = store->Current();
  EXPECT_EQ(trust->Find(kIssuer)
                ->Select({}, "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256")
                .size(),
            kCertificates + 1);
  std::set<std::string> names;
  for (const Signer& signer : trust->Find(kIssuer)->signers) {
    names.insert(signer.name);
  }
  EXPECT_EQ(names.size(), kCertificates + 1);
  EXPECT_EQ(store->Describe().signers.size(), kCertificates + 1);
}

}  // namespace

}  // namespace SsoClient::Access::Testing
