#include "trust/trust_config.h"

#include <filesystem>
#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

class TrustConfigTest : public TrustFixture {
 protected:
  std::string Refusal() const {
    return MessageOf<Tarnik::InvalidArgumentException>([this] { CheckTrustConfig(config); });
  }

  TrustedIssuer& issuer = config.issuers[0];
};

TEST_F(TrustConfigTest, IssuersNeedACertificateOrThePathOfOne) {
  EXPECT_EQ(Refusal(), "nothing");
  issuer.certificatePaths.clear();
  EXPECT_EQ(Refusal(), "An issuer of the trust store has neither a certificate nor a path of one.");
  issuer.certificates = {Sts(0).ToCertificate()};
  EXPECT_EQ(Refusal(), "nothing");
}

TEST_F(TrustConfigTest, EveryIssuerIsChecked) {
  config.issuers.emplace_back().issuer = kIssuer;
  EXPECT_EQ(Refusal(), "An issuer of the trust store has neither a certificate nor a path of one.");
}

TEST_F(TrustConfigTest, IssuerThatIsLeftOutIsNotAnyIssuer) {
  issuer.issuer.clear();
  EXPECT_EQ(Refusal(), "An entry of the trust store names no issuer and is not for any issuer.");
  issuer.isForAnyIssuer = true;
  EXPECT_EQ(Refusal(), "nothing");
}

TEST_F(TrustConfigTest, AnyIssuerHasNoName) {
  issuer.isForAnyIssuer = true;
  EXPECT_EQ(Refusal(), "An entry of the trust store names an issuer and is for any issuer.");
}

TEST_F(TrustConfigTest, CertificatesMustNotBeNull) {
  issuer.certificates = {Sts(0).ToCertificate(), nullptr};
  EXPECT_EQ(Refusal(), "A certificate of the trust store is null.");
}

TEST_F(TrustConfigTest, SignersOfListsNeedAList) {
  issuer.listSignerPaths = {"ca.pem"};
  EXPECT_EQ(Refusal(),
            "An issuer of the trust store has signers of revocation lists, but no path of one.");
  issuer.revocationListPaths = {"lists"};
  EXPECT_EQ(Refusal(), "nothing");
}

TEST_F(TrustConfigTest, PathsMustBeUsable) {
  issuer.revocationListPaths = {"lists"};
  for (auto* const paths :
       {&issuer.certificatePaths, &issuer.revocationListPaths, &issuer.listSignerPaths}) {
    paths->assign({""});
    EXPECT_EQ(Refusal(), "A path of the trust store is empty.");
    paths->assign({std::string("a\0b", 3)});
    EXPECT_EQ(Refusal(), "A path of the trust store contains a NUL.");
    paths->assign({"a"});
    EXPECT_EQ(Refusal(), "nothing");
  }
}

TEST_F(TrustConfigTest, RelativePathsBecomeAbsolute) {
  issuer.certificatePaths = {"a", "/b"};
  issuer.revocationListPaths = {"c"};
  issuer.listSignerPaths = {"../d"};
  MakePathsAbsolute(config);
  const std::string folder = std::filesystem::current_path().string();
  EXPECT_EQ(issuer.certificatePaths, (Names{folder + "/a", "/b"}));
  EXPECT_EQ(issuer.revocationListPaths, Names{folder + "/c"});
  EXPECT_EQ(issuer.listSignerPaths, Names{folder + "/../d"});
}

}  // namespace

}  // namespace SsoClient::Access::Testing
