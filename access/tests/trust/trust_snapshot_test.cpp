#include "trust/trust_snapshot.h"

#include <algorithm>
#include <string>
#include <string_view>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/xml/security/key_info.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Tarnik::Xml::Security::KeyInfo;

constexpr std::string_view kEcdsa = "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha256";
constexpr std::string_view kRsa = "http://www.w3.org/2001/04/xmldsig-more#rsa-sha256";

class TrustSnapshotTest : public TrustFixture {
 protected:
  static KeyInfo HintAt(const Identity& identity) {
    const auto certificate = identity.ToCertificate();
    KeyInfo keyInfo;
    keyInfo.certificates.emplace_back(certificate->DerBytes(),
                                      certificate->DerBytes() + certificate->DerLength());
    return keyInfo;
  }

  Names Select(const KeyInfo& keyInfo, std::string_view method = kEcdsa) const {
    Names names;
    const auto trust = store->Current();
    for (const Signer* signer : trust->Find(kIssuer)->Select(keyInfo, method)) {
      names.push_back(signer->certificate->SubjectName());
    }
    return names;
  }
};

TEST_F(TrustSnapshotTest, HintSelectsTheSigner) {
  Put("trust/b.pem", Sts(1).Pem());
  Make();
  EXPECT_EQ(Select(HintAt(Sts(1))), Names{"CN=sts-1"});
  EXPECT_EQ(Select(HintAt(Sts(0))), Names{"CN=sts-0"});
  EXPECT_EQ(Select(HintAt(Sts(2))), Names{});
}

TEST_F(TrustSnapshotTest, WithoutHintsAllAreSelected) {
  std::string all;
  for (std::size_t i = 1; i < 20; ++i) {
    all += Sts(i).Pem();
  }
  Put("trust/b.pem", all);
  Make();
  const Names selected = Select({});
  ASSERT_EQ(selected.size(), 20U);
  EXPECT_EQ(selected.front(), "CN=sts-0");
  EXPECT_EQ(selected.back(), "CN=sts-19");
}

TEST_F(TrustSnapshotTest, KeysOfAnotherTypeDoNotCountAmongMoreThanSixteen) {
  Tarnik::Testing::IdentityOptions options;
  options.commonName = "rsa";
  options.rsaBits = 2048;
  std::string all;
  for (std::size_t i = 1; i < 15; ++i) {
    all += Sts(i).Pem();
  }
  all += Tarnik::Testing::MakeIdentity(options, &TrustCa()).Pem();
  Put("trust/b.pem", all);
  Make();
  // With sixteen, verification says what does not fit.
  EXPECT_EQ(Select({}, kRsa).size(), 16U);
  Put("trust/c.pem", Sts(15).Pem());
  Make();
  EXPECT_EQ(Select({}, kRsa), Names{"CN=rsa"});
  const Names selected = Select({}, kEcdsa);
  EXPECT_EQ(selected.size(), 16U);
  EXPECT_EQ(std::count(selected.begin(), selected.end(), "CN=rsa"), 0);
}

TEST_F(TrustSnapshotTest, IssuersAreThoseOfWhomThereAreSigners) {
  config.issuers.emplace_back();
  config.issuers[1].issuer = "https://other.example";
  config.issuers[1].certificates = {Sts(1).ToCertificate()};
  Make();
  EXPECT_EQ(store->Current()->Issuers(),
            (std::vector<std::string_view>{"https://other.example", kIssuer}));
  Remove("trust/a.pem");
  store->Reload();
  EXPECT_EQ(store->Current()->Issuers(), std::vector<std::string_view>{"https://other.example"});
}

TEST_F(TrustSnapshotTest, NobodyIsSelectedWithoutSigners) {
  EXPECT_TRUE(IssuerTrust().Select({}, kEcdsa).empty());
}

}  // namespace

}  // namespace SsoClient::Access::Testing
