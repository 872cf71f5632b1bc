#include "trust/trust_config.h"

#include <filesystem>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>

#include "trust/trust_fixture.h"

namespace SsoClient::Access::Testing {

namespace {

const std::string kFirst = "entry issuers[0] ('https://sts.example') of the trust store";

class TrustConfigTest : public TrustFixture {
 protected:
  std::string Refusal() const {
    return MessageOf<Tarnik::InvalidArgumentException>([this] { CheckTrustConfig(config); });
  }

  TrustedIssuer& issuer = config.issuers[0];
};

TEST_F(TrustConfigTest, EntriesNeedACertificateOrThePathOfOne) {
  EXPECT_EQ(Refusal(), "nothing");
  issuer.certificatePaths.clear();
  EXPECT_EQ(Refusal(), "The " + kFirst + " has neither a certificate nor a path of one.");
  issuer.certificates = {Sts(0).ToCertificate()};
  EXPECT_EQ(Refusal(), "nothing");
}

TEST_F(TrustConfigTest, EveryEntryIsCheckedAndNamed) {
  config.issuers.emplace_back().issuer = "https://b\n";
  EXPECT_EQ(Refusal(),
            "The entry issuers[1] ('https://b?') of the trust store has neither a certificate nor "
            "a path of one.");
  config.issuers[1].issuer.clear();
  EXPECT_EQ(Refusal(),
            "The entry issuers[1] of the trust store names no issuer and is not for any issuer.");
  config.issuers[1].isForAnyIssuer = true;
  EXPECT_EQ(Refusal(),
            "The entry issuers[1] (any issuer) of the trust store has neither a certificate nor a "
            "path of one.");
}

TEST_F(TrustConfigTest, EntriesWithoutCertificatesAreNamedWithTheirPaths) {
  config.issuers.emplace_back().isForAnyIssuer = true;
  config.issuers[0].certificatePaths = {"/a", "/b"};
  config.issuers[1].certificatePaths = {"/c"};
  EXPECT_EQ(MessageOf<Tarnik::InvalidArgumentException>([this] { ThrowNoCertificate(config); }),
            "The trust store has no certificate. Its entries contain none in '/a' (issuers[0], "
            "'https://sts.example'), '/b' (issuers[0], 'https://sts.example'), '/c' (issuers[1], "
            "any issuer).");
}

TEST_F(TrustConfigTest, IssuerThatIsLeftOutIsNotAnyIssuer) {
  issuer.issuer.clear();
  EXPECT_EQ(Refusal(),
            "The entry issuers[0] of the trust store names no issuer and is not for any issuer.");
  issuer.isForAnyIssuer = true;
  EXPECT_EQ(Refusal(), "nothing");
}

TEST_F(TrustConfigTest, AnyIssuerHasNoName) {
  issuer.isForAnyIssuer = true;
  EXPECT_EQ(Refusal(), "The " + kFirst + " names an issuer and is for any issuer.");
}

TEST_F(TrustConfigTest, CertificatesMustNotBeNull) {
  issuer.certificates = {Sts(0).ToCertificate(), nullptr};
  EXPECT_EQ(Refusal(), "The certificate certificates[1] of the " + kFirst + " is null.");
}

TEST_F(TrustConfigTest, SignersOfListsNeedAList) {
  issuer.listSignerPaths = {"ca.pem"};
  EXPECT_EQ(Refusal(),
            "The " + kFirst + " has signers of revocation lists, but no path of a list.");
  issuer.revocationListPaths = {"lists"};
  EXPECT_EQ(Refusal(), "nothing");
}

TEST_F(TrustConfigTest, PathsMustBeUsable) {
  issuer.revocationListPaths = {"lists"};
  const std::pair<const char*, std::vector<std::string>*> members[] = {
      {"certificatePaths", &issuer.certificatePaths},
      {"revocationListPaths", &issuer.revocationListPaths},
      {"listSignerPaths", &issuer.listSignerPaths}};
  for (const auto& [member, paths] : members) {
    const std::string name = "[1] of the " + kFirst;
    paths->assign({"a", ""});
    EXPECT_EQ(Refusal(), "The path " + std::string(member) + name + " is empty.");
    paths->assign({"a", std::string("a\0b", 3)});
    EXPECT_EQ(Refusal(), "The path " + std::string(member) + name + " contains a NUL: 'a?b'.");
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
