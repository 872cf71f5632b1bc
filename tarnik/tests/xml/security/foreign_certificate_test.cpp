#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/certificate.h>

#include "crypto/hash.h"
#include "support/key_info_texts.h"
#include "support/test_certificates.h"
#include "xml/security/trusted_certificates.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml::Security;
using Crypto::Certificate;
using testing::ElementsAre;
using testing::IsEmpty;

using Trusted = Ref<const Certificate>;
using Bytes = std::vector<unsigned char>;

// A certificate of a caller's own class.
class ForeignCertificate final : public Certificate, public ObjectImpl {
 public:
  ForeignCertificate(Trusted certificate, Bytes der)
      : certificate_(std::move(certificate)), der_(std::move(der)) {}

  const unsigned char* DerBytes() const noexcept override { return der_.data(); }
  std::size_t DerLength() const noexcept override { return der_.size(); }
  const std::string& SubjectName() const override { return certificate_->SubjectName(); }
  const std::string& IssuerName() const override { return certificate_->IssuerName(); }
  const std::string& SerialNumber() const override { return certificate_->SerialNumber(); }
  System::DateTime NotBefore() const override { return certificate_->NotBefore(); }
  System::DateTime NotAfter() const override { return certificate_->NotAfter(); }
  const Bytes& SubjectKeyIdentifier() const override {
    return certificate_->SubjectKeyIdentifier();
  }
  Ref<const Crypto::PublicKey> GetPublicKey() const override {
    return certificate_->GetPublicKey();
  }

 private:
  const Trusted certificate_;
  const Bytes der_;
};

Bytes DerOf(const Trusted& certificate) {
  return {certificate->DerBytes(), certificate->DerBytes() + certificate->DerLength()};
}

class ForeignCertificateTest : public testing::Test {
 protected:
  static Trusted Make(const OpenSsl::OwnedKey& key, const char* serial) {
    return MakeCertificate({.key = key.get(), .serial = serial, .withKeyIdentifier = true});
  }
  static Trusted Foreign(const Trusted& certificate) {
    return MakeRef<const ForeignCertificate>(certificate, DerOf(certificate));
  }

  const Trusted first_ = Make(MakeEcKey("P-256"), "1");
  const Trusted second_ = Make(MakeEcKey("P-256"), "2");
  const TrustedCertificates list_{{Foreign(first_), Foreign(second_)}};
};

TEST_F(ForeignCertificateTest, IsNamedByItsKeyIdentifier) {
  KeyInfo keyInfo;
  keyInfo.subjectKeyIdentifiers = {second_->SubjectKeyIdentifier()};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(second_->GetPublicKey()));
}

TEST_F(ForeignCertificateTest, IsNamedByItsKey) {
  EXPECT_THAT(list_.NamedBy(ReadHints(DerEncodedKey(*second_))),
              ElementsAre(second_->GetPublicKey()));
  EXPECT_THAT(list_.NamedBy(ReadHints(DerEncodedKey(*Make(MakeEcKey("P-256"), "3")))), IsEmpty());
}

TEST_F(ForeignCertificateTest, IsNamedByTheIssuerOfACertificate) {
  KeyInfo keyInfo;
  keyInfo.certificates = {DerOf(second_)};
  EXPECT_THAT(list_.NamedByIssuer(keyInfo), ElementsAre(second_->GetPublicKey()));
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(second_->GetPublicKey()));
  keyInfo.certificates = {DerOf(Make(MakeEcKey("P-256"), "3"))};
  EXPECT_THAT(list_.NamedByIssuer(keyInfo), IsEmpty());
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());
}

TEST_F(ForeignCertificateTest, IsNamedByAnotherSpellingOfItsNames) {
  KeyInfo keyInfo;
  keyInfo.issuerSerials = {{"2.5.4.3=#0c067369676e6572,O=\"Test, Inc.\"", "2"}};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(second_->GetPublicKey()));
  keyInfo = KeyInfo();
  keyInfo.subjectNames = {"cn=SIGNER, O=\"Test, Inc.\""};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(first_->GetPublicKey(), second_->GetPublicKey()));
}

TEST_F(ForeignCertificateTest, WithTheKeyOfAnotherIsOneCandidate) {
  const TrustedCertificates list({first_, Foreign(first_), Foreign(second_)});
  EXPECT_THAT(list.NamedBy(KeyInfo()),
              ElementsAre(first_->GetPublicKey(), second_->GetPublicKey()));
}

TEST_F(ForeignCertificateTest, ThatCannotBeDecodedIsNamedByWhatItSays) {
  const Bytes noDer = {1, 2, 3};
  const TrustedCertificates list({MakeRef<const ForeignCertificate>(first_, noDer),
                                  MakeRef<const ForeignCertificate>(second_, Bytes())});
  KeyInfo keyInfo;
  keyInfo.issuerSerials = {{first_->IssuerName(), "1"}};
  EXPECT_THAT(list.NamedBy(keyInfo), ElementsAre(first_->GetPublicKey()));
  keyInfo.issuerSerials.clear();
  keyInfo.certificates = {noDer};
  EXPECT_THAT(list.NamedBy(keyInfo), ElementsAre(first_->GetPublicKey()));
  EXPECT_THAT(list.NamedBy(ReadHints(DerEncodedKey(*second_))), IsEmpty());
  EXPECT_THAT(list.NamedBy(KeyInfo()),
              ElementsAre(first_->GetPublicKey(), second_->GetPublicKey()));
}

}  // namespace
}  // namespace Tarnik::Testing
