#include "trust/trust_snapshot.h"

#include <string>

#include <gtest/gtest.h>

#include <tarnik/xml/security/key_info.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

using Tarnik::Xml::Security::KeyInfo;

class TrustSnapshotTest : public TrustFixture {
 protected:
  static KeyInfo HintAt(const Identity& identity) {
    const auto certificate = identity.ToCertificate();
    KeyInfo keyInfo;
    keyInfo.certificates.emplace_back(certificate->DerBytes(),
                                      certificate->DerBytes() + certificate->DerLength());
    return keyInfo;
  }

  Names Select(const KeyInfo& keyInfo) const {
    Names names;
    const auto trust = store->Current();
    for (const Signer* signer : trust->Find(kIssuer)->Select(keyInfo)) {
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

TEST_F(TrustSnapshotTest, WithoutHintsTheFirstSixteenAreSelected) {
  std::string all;
  for (std::size_t i = 1; i < 20; ++i) {
    all += Sts(i).Pem();
  }
  Put("trust/b.pem", all);
  Make();
  const Names selected = Select({});
  ASSERT_EQ(selected.size(), 16U);
  EXPECT_EQ(selected.front(), "CN=sts-0");
  EXPECT_EQ(selected.back(), "CN=sts-15");
}

TEST_F(TrustSnapshotTest, NobodyIsSelectedWithoutSigners) {
  EXPECT_TRUE(IssuerTrust().Select({}).empty());
}

}  // namespace

}  // namespace SsoClient::Access::Testing
