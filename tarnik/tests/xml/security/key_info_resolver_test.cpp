#include <cstddef>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/key_info_texts.h"
#include "support/openssl.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using Crypto::Certificate;
using testing::ElementsAre;
using testing::IsEmpty;

class Resolvers : public testing::Test {
 protected:
  static std::vector<unsigned char> DerOf(const Ref<const Certificate>& certificate) {
    return {certificate->DerBytes(), certificate->DerBytes() + certificate->DerLength()};
  }

  const OpenSsl::OwnedKey otherKey_ = MakeEcKey("P-256");
  const Ref<const Certificate> first_ = MakeCertificate(
      {.commonName = "first", .issuerCommonName = "ca", .serial = "1", .withKeyIdentifier = true});
  const Ref<const Certificate> second_ = MakeCertificate({.key = otherKey_.get(),
                                                          .commonName = "second",
                                                          .issuerCommonName = "ca",
                                                          .serial = "2",
                                                          .withKeyIdentifier = true});
  const Ref<const Certificate> stranger_ = MakeCertificate({.key = otherKey_.get(),
                                                            .commonName = "stranger",
                                                            .issuerCommonName = "other",
                                                            .serial = "3"});
};

class TrustedCertificatesResolverTest : public Resolvers {
 protected:
  const Ref<const KeyInfoResolver> resolver_ = CreateTrustedCertificatesResolver({first_, second_});
};

TEST_F(TrustedCertificatesResolverTest, FindsAnEmbeddedCertificateByItsBytes) {
  KeyInfo keyInfo;
  keyInfo.certificates = {DerOf(second_)};
  EXPECT_EQ(resolver_->Resolve(keyInfo), second_->GetPublicKey());
  keyInfo.certificates = {DerOf(stranger_), DerOf(first_)};
  EXPECT_EQ(resolver_->Resolve(keyInfo), first_->GetPublicKey());
}

TEST_F(TrustedCertificatesResolverTest, TrustsNoCertificateThatDiffersInOneByte) {
  KeyInfo keyInfo;
  keyInfo.certificates = {DerOf(first_)};
  for (const std::size_t place : {std::size_t{0}, DerOf(first_).size() - 1}) {
    auto altered = DerOf(first_);
    altered[place] ^= 1;
    keyInfo.certificates = {altered};
    EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
  }
  auto longer = DerOf(first_);
  longer.push_back(0);
  keyInfo.certificates = {longer};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
}

TEST_F(TrustedCertificatesResolverTest, IgnoresOtherHintsNextToACertificate) {
  KeyInfo keyInfo;
  keyInfo.subjectNames = {first_->SubjectName()};
  EXPECT_EQ(resolver_->Resolve(keyInfo), first_->GetPublicKey());
  keyInfo.certificates = {DerOf(stranger_)};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
}

TEST_F(TrustedCertificatesResolverTest, FindsByIssuerAndSerialNumber) {
  KeyInfo keyInfo;
  keyInfo.issuerSerials = {{"CN = ca, O=Test\\, Inc.", "002"}};
  EXPECT_EQ(resolver_->Resolve(keyInfo), second_->GetPublicKey());
  keyInfo.issuerSerials = {{second_->IssuerName(), "20"}};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
  keyInfo.issuerSerials = {{"CN=other", "2"}};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
}

TEST_F(TrustedCertificatesResolverTest, FindsBySubjectKeyIdentifier) {
  KeyInfo keyInfo;
  keyInfo.subjectKeyIdentifiers = {second_->SubjectKeyIdentifier()};
  EXPECT_EQ(resolver_->Resolve(keyInfo), second_->GetPublicKey());
  keyInfo.subjectKeyIdentifiers = {{1, 2, 3}};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
}

TEST_F(TrustedCertificatesResolverTest, FindsBySubjectName) {
  KeyInfo keyInfo;
  keyInfo.subjectNames = {"CN=second, O=Test\\, Inc."};
  EXPECT_EQ(resolver_->Resolve(keyInfo), second_->GetPublicKey());
  keyInfo.subjectNames = {"CN=nobody"};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
}

TEST_F(TrustedCertificatesResolverTest, CountsACertificateThatIsGivenTwiceOnce) {
  const auto resolver = CreateTrustedCertificatesResolver({first_, second_, first_});
  KeyInfo keyInfo;
  keyInfo.subjectNames = {first_->SubjectName()};
  EXPECT_EQ(resolver->Resolve(keyInfo), first_->GetPublicKey());
}

TEST_F(TrustedCertificatesResolverTest, ReturnsNoKeyWhenAHintNamesSeveralCertificates) {
  KeyInfo keyInfo;
  keyInfo.subjectNames = {first_->SubjectName(), second_->SubjectName()};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
  keyInfo.subjectNames = {first_->SubjectName(), "CN=nobody"};
  EXPECT_EQ(resolver_->Resolve(keyInfo), first_->GetPublicKey());
}

TEST_F(TrustedCertificatesResolverTest, NeedsNoHintWhenOnlyOneCertificateIsTrusted) {
  KeyInfo keyInfo;
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
  const auto single = CreateTrustedCertificatesResolver({first_});
  EXPECT_EQ(single->Resolve(keyInfo), first_->GetPublicKey());
  keyInfo.keyNames = {"whatever"};
  EXPECT_EQ(single->Resolve(keyInfo), first_->GetPublicKey());
}

TEST_F(TrustedCertificatesResolverTest, ReturnsAllCandidates) {
  const auto& candidates = dynamic_cast<const KeyCandidatesResolver&>(*resolver_);
  const auto first = first_->GetPublicKey();
  const auto second = second_->GetPublicKey();
  KeyInfo keyInfo;
  EXPECT_THAT(candidates.Candidates(keyInfo), ElementsAre(first, second));
  keyInfo.subjectNames = {second_->SubjectName(), first_->SubjectName()};
  EXPECT_THAT(candidates.Candidates(keyInfo), ElementsAre(first, second));
  keyInfo.subjectNames = {"cn=SECOND, o=\"test, inc.\""};
  EXPECT_THAT(candidates.Candidates(keyInfo), ElementsAre(second));
  keyInfo.subjectNames = {"CN=nobody"};
  EXPECT_THAT(candidates.Candidates(keyInfo), IsEmpty());
}

TEST_F(TrustedCertificatesResolverTest, ReturnsTheKeyThatTheMessageContains) {
  EXPECT_EQ(resolver_->Resolve(ReadHints(DerEncodedKey(*second_))), second_->GetPublicKey());
  EXPECT_EQ(resolver_->Resolve(ReadHints(DigestOf(*first_, kSha256Uri, Crypto::Hash::kSha256))),
            first_->GetPublicKey());
  const auto alien = MakeCertificate({.key = MakeEcKey("P-256").get()});
  EXPECT_EQ(resolver_->Resolve(ReadHints(DerEncodedKey(*alien))), nullptr);
}

TEST_F(TrustedCertificatesResolverTest, IgnoresBrokenCertificates) {
  KeyInfo keyInfo;
  keyInfo.certificates = {{1, 2, 3}};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
}

class CertificateIssuerResolverTest : public Resolvers {
 protected:
  const Ref<const KeyInfoResolver> resolver_ = CreateCertificateIssuerResolver({first_, second_});
};

TEST_F(CertificateIssuerResolverTest, FindsByTheIssuerThatIsNamed) {
  KeyInfo keyInfo;
  keyInfo.issuerSerials = {{second_->IssuerName(), "2"}};
  EXPECT_EQ(resolver_->Resolve(keyInfo), second_->GetPublicKey());
}

TEST_F(CertificateIssuerResolverTest, ReadsTheIssuersNameInAnySpelling) {
  KeyInfo keyInfo;
  for (const char* name : {"cn=CA, O=\"Test, Inc.\"", "2.5.4.3=#0c026361;O=Test\\2C Inc."}) {
    keyInfo.issuerSerials = {{name, "2"}};
    EXPECT_EQ(resolver_->Resolve(keyInfo), second_->GetPublicKey()) << name;
  }
  for (const char* name : {"CN=ca,O=Test, Inc.", "O=Test\\, Inc.,CN=ca", "CN=c a,O=Test\\, Inc."}) {
    keyInfo.issuerSerials = {{name, "2"}};
    EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr) << name;
  }
}

TEST_F(CertificateIssuerResolverTest, FindsByTheIssuerOfAnEmbeddedCertificate) {
  KeyInfo keyInfo;
  keyInfo.certificates = {DerOf(first_)};
  EXPECT_EQ(resolver_->Resolve(keyInfo), first_->GetPublicKey());
  keyInfo.certificates = {DerOf(stranger_)};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
}

TEST_F(CertificateIssuerResolverTest, IgnoresACertificateNextToANamedIssuer) {
  KeyInfo keyInfo;
  keyInfo.issuerSerials = {{second_->IssuerName(), "2"}};
  keyInfo.certificates = {DerOf(first_)};
  EXPECT_EQ(resolver_->Resolve(keyInfo), second_->GetPublicKey());
}

TEST_F(CertificateIssuerResolverTest, ReturnsTheTrustedKeyForAStrangerWithTheSameIssuer) {
  const auto namesake = MakeCertificate(
      {.key = otherKey_.get(), .commonName = "first", .issuerCommonName = "ca", .serial = "1"});
  KeyInfo keyInfo;
  keyInfo.certificates = {DerOf(namesake)};
  EXPECT_EQ(resolver_->Resolve(keyInfo), first_->GetPublicKey());
  EXPECT_NE(resolver_->Resolve(keyInfo), namesake->GetPublicKey());
}

TEST_F(CertificateIssuerResolverTest, ReturnsNoKeyForASignatureWithoutAnIssuer) {
  KeyInfo keyInfo;
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
  EXPECT_EQ(CreateCertificateIssuerResolver({first_})->Resolve(keyInfo), nullptr);
  keyInfo.subjectNames = {first_->SubjectName()};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
  keyInfo.certificates = {{1, 2, 3}};
  EXPECT_EQ(resolver_->Resolve(keyInfo), nullptr);
}

template <class Create>
void ExpectArgumentChecks(Create create) {
  EXPECT_THROW(create({}), InvalidArgumentException);
  EXPECT_THROW(create({MakeCertificate(), nullptr}), InvalidArgumentException);
}

TEST(KeyInfoResolverTest, RefusesMissingCertificates) {
  ExpectArgumentChecks([](std::vector<Ref<const Certificate>> certificates) {
    CreateTrustedCertificatesResolver(std::move(certificates));
  });
  ExpectArgumentChecks([](std::vector<Ref<const Certificate>> certificates) {
    CreateCertificateIssuerResolver(std::move(certificates));
  });
}

}  // namespace
}  // namespace Tarnik::Testing
