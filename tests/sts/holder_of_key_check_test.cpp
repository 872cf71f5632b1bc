#include "sts/holder_of_key_check.h"

#include <chrono>
#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include <boost/none.hpp>
#include <gmock/gmock.h>

#include <devsts/certificates.h>
#include <ssoclient/holder_of_key_config.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/crypto/public_key.h>
#include <tarnik/system/date_time.h>

#include "support/holder_of_key.h"
#include "support/thrown_message.h"

namespace SsoClient::Testing {
namespace {

using namespace std::chrono_literals;
using Tarnik::InvalidArgumentException;
using Tarnik::InvalidStateException;
using Tarnik::Crypto::KeyAlgorithm;
using Tarnik::System::DateTime;
using Tarnik::System::GetUtcDateTime;

std::string ErrorMessage(const HolderOfKeyConfig& config) {
  return ThrownMessage<InvalidArgumentException>([&] { CheckHolderOfKeyConfig(config); });
}

TEST(HolderOfKeyCheckTest, AcceptsNoConfigurationAndAMatchingOne) {
  EXPECT_NO_THROW(CheckHolderOfKeyConfig(boost::none));
  EXPECT_NO_THROW(CheckHolderOfKeyConfig(ConfigOf(KeyCredential())));
}

TEST(HolderOfKeyCheckTest, RefusesNullParts) {
  auto config = ConfigOf(KeyCredential());
  config.privateKey = nullptr;
  EXPECT_EQ(ErrorMessage(config), "HolderOfKeyConfig: the private key must not be null.");
  config.certificate = nullptr;
  EXPECT_EQ(ErrorMessage(config), "HolderOfKeyConfig: the certificate must not be null.");
}

TEST(HolderOfKeyCheckTest, RefusesAKeyOfAnotherCertificate) {
  auto config = ConfigOf(KeyCredential());
  config.privateKey = ConfigOf(KeyCredential(DevSts::KeyType::Rsa3072)).privateKey;
  EXPECT_EQ(ErrorMessage(config),
            "HolderOfKeyConfig: the private key does not belong to the certificate.");
}

TEST(HolderOfKeyCheckTest, RefusesKeysThatCannotSign) {
  EXPECT_EQ(ErrorMessage(ConfigOf(KeyCredential(DevSts::KeyType::EcP256))),
            "HolderOfKeyConfig: the key must be an RSA key, since requests are signed with "
            "RSA-SHA256.");
  EXPECT_EQ(ErrorMessage(ConfigOf(KeyCredential(DevSts::KeyType::Rsa1024))),
            "HolderOfKeyConfig: the RSA key must have at least 2048 bits.");
}

/// A certificate that the caller implements and that returns these bytes.
class ForeignCertificate final : public Tarnik::Crypto::Certificate, public Tarnik::ObjectImpl {
 public:
  explicit ForeignCertificate(std::string der) : der_(std::move(der)) {}

  const unsigned char* DerBytes() const noexcept override {
    return der_.empty() ? nullptr : reinterpret_cast<const unsigned char*>(der_.data());
  }
  std::size_t DerLength() const noexcept override { return der_.size(); }
  const std::string& SubjectName() const override { return der_; }
  const std::string& IssuerName() const override { return der_; }
  const std::string& SerialNumber() const override { return der_; }
  DateTime NotBefore() const override { return GetUtcDateTime(); }
  DateTime NotAfter() const override { return GetUtcDateTime(); }
  const std::vector<unsigned char>& SubjectKeyIdentifier() const override { return identifier_; }
  Tarnik::Ref<const Tarnik::Crypto::PublicKey> GetPublicKey() const override { return nullptr; }

 private:
  std::string der_;
  std::vector<unsigned char> identifier_;
};

/// A private key that the caller implements and that claims to match.
class ForeignKey final : public Tarnik::Crypto::PrivateKey, public Tarnik::ObjectImpl {
 public:
  explicit ForeignKey(Tarnik::Ref<const Tarnik::Crypto::PublicKey> half) : half_(std::move(half)) {}

  Tarnik::Ref<const Tarnik::Crypto::PublicKey> GetPublicKey() const override { return half_; }
  bool Matches(const Tarnik::Crypto::Certificate&) const override { return true; }

 private:
  Tarnik::Ref<const Tarnik::Crypto::PublicKey> half_;
};

/// A public half of this kind and length.
class ForeignHalf final : public Tarnik::Crypto::PublicKey, public Tarnik::ObjectImpl {
 public:
  ForeignHalf(KeyAlgorithm algorithm, int bits) : algorithm_(algorithm), bits_(bits) {}

  KeyAlgorithm Algorithm() const noexcept override { return algorithm_; }
  int Bits() const noexcept override { return bits_; }

 private:
  KeyAlgorithm algorithm_;
  int bits_;
};

TEST(HolderOfKeyCheckTest, RefusesCertificatesThatHoldNoKey) {
  auto config = ConfigOf(KeyCredential());
  config.certificate = Tarnik::MakeRef<const ForeignCertificate>("");
  EXPECT_EQ(ErrorMessage(config),
            "HolderOfKeyConfig: the certificate cannot be used: A certificate cannot be empty.");
  config.certificate = Tarnik::MakeRef<const ForeignCertificate>("no DER");
  EXPECT_THAT(ErrorMessage(config),
              testing::StartsWith("HolderOfKeyConfig: the certificate cannot be used: The "
                                  "certificate cannot be decoded: "));
  const auto genuine = ConfigOf(KeyCredential()).certificate;
  std::string unknownKind(reinterpret_cast<const char*>(genuine->DerBytes()), genuine->DerLength());
  // The object identifier of RSA keys with another last component.
  const std::string rsa("\x2a\x86\x48\x86\xf7\x0d\x01\x01\x01", 9);
  unknownKind.replace(unknownKind.find(rsa) + 8, 1, "\x7f");
  config.certificate = Tarnik::MakeRef<const ForeignCertificate>(unknownKind);
  EXPECT_EQ(ErrorMessage(config),
            "HolderOfKeyConfig: the certificate cannot be used: The certificate's public key is "
            "broken or of an unknown kind.");
}

TEST(HolderOfKeyCheckTest, RefusesAForeignKeyWithoutAPublicHalf) {
  auto config = ConfigOf(KeyCredential());
  config.privateKey = Tarnik::MakeRef<const ForeignKey>(nullptr);
  EXPECT_EQ(ErrorMessage(config), "HolderOfKeyConfig: the private key has no public half.");
}

TEST(HolderOfKeyCheckTest, AcceptsOnlyRsaKeysOfTheLeastLength) {
  auto config = ConfigOf(KeyCredential());
  const auto errorFor = [&](KeyAlgorithm algorithm, int bits) {
    config.privateKey =
        Tarnik::MakeRef<const ForeignKey>(Tarnik::MakeRef<const ForeignHalf>(algorithm, bits));
    return ErrorMessage(config);
  };
  EXPECT_EQ(errorFor(KeyAlgorithm::kRsa, 2048), "Nothing was thrown.");
  EXPECT_EQ(errorFor(KeyAlgorithm::kRsa, 2047),
            "HolderOfKeyConfig: the RSA key must have at least 2048 bits.");
  for (const KeyAlgorithm algorithm :
       {KeyAlgorithm::kRsaPss, KeyAlgorithm::kEc, KeyAlgorithm::kOther}) {
    EXPECT_EQ(errorFor(algorithm, 2048),
              "HolderOfKeyConfig: the key must be an RSA key, since requests are signed with "
              "RSA-SHA256.");
  }
}

std::string PeriodError(const Tarnik::Crypto::Certificate& certificate, const DateTime& now) {
  return ThrownMessage<InvalidStateException>([&] { CheckPeriodOfValidity(certificate, now); });
}

DateTime Later(const DateTime& time, long seconds) {
  return Tarnik::System::DateTimeFromUtc(time.GetUtcTime() + seconds * 1'000'000, false);
}

TEST(HolderOfKeyCheckTest, ChecksThePeriodOfValidityWithTenMinutesOfTolerance) {
  const auto certificate = ConfigOf(KeyCredential()).certificate;
  const std::string accepted = "Nothing was thrown.";
  EXPECT_EQ(PeriodError(*certificate, GetUtcDateTime()), accepted);
  EXPECT_EQ(PeriodError(*certificate, Later(certificate->NotBefore(), -600)), accepted);
  EXPECT_EQ(PeriodError(*certificate, Later(certificate->NotAfter(), 600)), accepted);
  EXPECT_EQ(PeriodError(*certificate, Later(certificate->NotBefore(), -601)),
            "The holder-of-key certificate of `" + certificate->SubjectName() +
                "' is not valid before " + certificate->NotBefore().ToString());
  EXPECT_EQ(PeriodError(*certificate, Later(certificate->NotAfter(), 601)),
            "The holder-of-key certificate of `" + certificate->SubjectName() + "' expired at " +
                certificate->NotAfter().ToString());
}

}  // namespace
}  // namespace SsoClient::Testing
