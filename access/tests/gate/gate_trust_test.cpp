// A gate with a trust store that watches its files.
#include <filesystem>

#include "gate/gate_fixture.h"
#include "support/temporary_file.h"
#include "support/virtual_runtime.h"

namespace SsoClient::Access::Testing {
namespace {

/// Trusts the certificates in a folder, and remembers a token whose signer is in it.
class GateTrustTest : public GateFixture {
 protected:
  GateTrustTest() {
    std::filesystem::create_directory(root.Path() + "/trust");
    Put("trust/a.pem", TrustedCredential().certificatePem);
    TrustStoreConfig store;
    store.issuers.resize(1);
    store.issuers[0].issuer = kTokenIssuer;
    store.issuers[0].certificatePaths = {root.Path() + "/trust"};
    config.trust = CreateTrustStore(store, runtime);
    gate = Make();
    ExpectAccepted(Present());
    // From now on, files are read only when they have changed.
    runtime->Advance(std::chrono::seconds(1));
    ExpectAccepted(Present());
    EXPECT_EQ(gate->Metrics().cacheHits, 1U);
  }

  void Put(const std::string& name, const std::string& content) const {
    std::filesystem::rename(root.Write("new", content), root.Path() + "/" + name);
  }
  void Rename(const std::string& from, const std::string& to) const {
    std::filesystem::rename(root.Path() + "/" + from, root.Path() + "/" + to);
  }
  Verdict Present() const { return gate->Check(token, Presenter::Nobody()); }
  Verdict PresentASecondLater() const {
    runtime->Advance(std::chrono::seconds(1));
    return Present();
  }

  const Tarnik::Testing::TemporaryFolder root;
  const std::shared_ptr<VirtualRuntime> runtime = std::make_shared<VirtualRuntime>();
  const std::string token = Signed(text);
  std::shared_ptr<TokenGate> gate;
};

TEST_F(GateTrustTest, TrustThatIsTakenAwayCountsForRememberedTokens) {
  Rename("trust/a.pem", "a.pem");
  ExpectRefused(PresentASecondLater(), Reason::kUnknownIssuer, CheckKind::kSignerKnown);
  Rename("a.pem", "trust/a.pem");
  ExpectAccepted(PresentASecondLater());
}

TEST_F(GateTrustTest, TrustThatIsReplacedCountsForRememberedTokens) {
  Put("trust/a.pem", StrangerCredential().certificatePem);
  ExpectRefused(PresentASecondLater(), Reason::kUnknownSigner, CheckKind::kSignerKnown);
  ExpectAccepted(gate->Check(text.ToSignedXml(StrangerCredential()), Presenter::Nobody()));
}

TEST_F(GateTrustTest, BrokenFileKeepsTheTrustAndWhatIsRemembered) {
  Put("trust/b.pem", "broken");
  ExpectAccepted(PresentASecondLater());
  EXPECT_NE(config.trust->Describe().failure, "");
  EXPECT_EQ(gate->Metrics().cacheHits, 2U);
}

TEST_F(GateTrustTest, RenamedFolderKeepsTheTrustAndWhatIsRemembered) {
  Rename("trust", "away");
  ExpectAccepted(PresentASecondLater());
  EXPECT_NE(config.trust->Describe().failure, "");
  EXPECT_EQ(gate->Metrics().cacheHits, 2U);
}

}  // namespace
}  // namespace SsoClient::Access::Testing
