#include "sts/holder_of_key_check.h"

#include <gmock/gmock.h>
#include <tarnik/core/exception.h>

#include <chrono>

#include "support/holder_of_key.h"
#include "support/thrown_message.h"

namespace SsoClient {
namespace {

using namespace std::chrono_literals;
using Tarnik::InvalidArgumentException;
using Tarnik::InvalidStateException;
using Tarnik::System::DateTime;
using Tarnik::System::GetUtcDateTime;
using TestSupport::ThrownMessage;

std::string Complaint(const HolderOfKeyConfig& config) {
  return ThrownMessage<InvalidArgumentException>([&] { CheckHolderOfKeyConfig(config); });
}

TEST(HolderOfKeyCheckTest, AcceptsNoneAndOneThatFits) {
  EXPECT_NO_THROW(CheckHolderOfKeyConfig(boost::none));
  EXPECT_NO_THROW(CheckHolderOfKeyConfig(Testing::ConfigOf(Testing::KeyCredential())));
}

TEST(HolderOfKeyCheckTest, RefusesNullParts) {
  auto config = Testing::ConfigOf(Testing::KeyCredential());
  config.privateKey = nullptr;
  EXPECT_EQ(Complaint(config), "HolderOfKeyConfig: the private key must not be null.");
  config.certificate = nullptr;
  EXPECT_EQ(Complaint(config), "HolderOfKeyConfig: the certificate must not be null.");
}

TEST(HolderOfKeyCheckTest, RefusesAKeyOfAnotherCertificate) {
  auto config = Testing::ConfigOf(Testing::KeyCredential());
  config.privateKey =
      Testing::ConfigOf(Testing::KeyCredential(DevSts::KeyType::Rsa3072)).privateKey;
  EXPECT_EQ(Complaint(config),
            "HolderOfKeyConfig: the private key does not belong to the certificate.");
}

TEST(HolderOfKeyCheckTest, RefusesKeysThatCannotSign) {
  EXPECT_EQ(Complaint(Testing::ConfigOf(Testing::KeyCredential(DevSts::KeyType::EcP256))),
            "HolderOfKeyConfig: the key must be an RSA key, since requests are signed with "
            "RSA-SHA256.");
  EXPECT_EQ(Complaint(Testing::ConfigOf(Testing::KeyCredential(DevSts::KeyType::Rsa1024))),
            "HolderOfKeyConfig: the RSA key must have at least 2048 bits.");
}

std::string PeriodComplaint(const Tarnik::Crypto::Certificate& certificate, const DateTime& now) {
  return ThrownMessage<InvalidStateException>([&] { CheckPeriodOfValidity(certificate, now); });
}

DateTime Later(const DateTime& time, long seconds) {
  return Tarnik::System::DateTimeFromUtc(time.GetUtcTime() + seconds * 1'000'000, false);
}

TEST(HolderOfKeyCheckTest, HoldsThePeriodOfValidityWithTenMinutesForTheClocks) {
  const auto certificate = Testing::ConfigOf(Testing::KeyCredential()).certificate;
  const std::string accepted = "Nothing was thrown.";
  EXPECT_EQ(PeriodComplaint(*certificate, GetUtcDateTime()), accepted);
  EXPECT_EQ(PeriodComplaint(*certificate, Later(certificate->NotBefore(), -600)), accepted);
  EXPECT_EQ(PeriodComplaint(*certificate, Later(certificate->NotAfter(), 600)), accepted);
  EXPECT_EQ(PeriodComplaint(*certificate, Later(certificate->NotBefore(), -601)),
            "The holder-of-key certificate of `" + certificate->SubjectName() +
                "' is not valid before " + certificate->NotBefore().ToString());
  EXPECT_EQ(PeriodComplaint(*certificate, Later(certificate->NotAfter(), 601)),
            "The holder-of-key certificate of `" + certificate->SubjectName() + "' expired at " +
                certificate->NotAfter().ToString());
}

}  // namespace
}  // namespace SsoClient
