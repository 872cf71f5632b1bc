// Unusable configurations, reported when a service is created or when it signs.
#include <chrono>
#include <memory>
#include <string>
#include <typeinfo>

#include <gmock/gmock.h>

#include "integration/holder_of_key_fixture.h"
#include "integration/operation.h"
#include "support/holder_of_key.h"

namespace SsoClient::Testing {
namespace {

using std::chrono::hours;
using std::chrono::seconds;
using testing::IsEmpty;
using testing::SizeIs;

struct BrokenCase {
  const char* name;
  HolderOfKeyConfig (*config)();
  const char* message;
};

DevSts::Credential CredentialOf(DevSts::KeyType type) {
  DevSts::CertificateSpec spec;
  spec.commonName = "broken";
  spec.keyType = type;
  return DevSts::MakeCertificate(spec);
}

HolderOfKeyConfig WithoutCertificate() {
  HolderOfKeyConfig config = ConfigOf(Holder());
  config.certificate = nullptr;
  return config;
}

HolderOfKeyConfig WithoutKey() {
  HolderOfKeyConfig config = ConfigOf(Holder());
  config.privateKey = nullptr;
  return config;
}

HolderOfKeyConfig Mismatched() {
  return {ConfigOf(Holder()).certificate, ConfigOf(Stranger()).privateKey};
}

HolderOfKeyConfig MismatchedInKind() {
  return {ConfigOf(Holder()).certificate,
          ConfigOf(CredentialOf(DevSts::KeyType::EcP256)).privateKey};
}

template <DevSts::KeyType type>
HolderOfKeyConfig OfType() {
  return ConfigOf(CredentialOf(type));
}

class BrokenConfigTest : public HolderOfKeyTest, public testing::WithParamInterface<BrokenCase> {};

TEST_P(BrokenConfigTest, IsRefusedWhenTheServiceIsMade) {
  const auto sslContext = TrustCa(Sts());
  SecurityTokenServiceConfig config;
  config.url = Sts().HttpsUrl();
  config.sslContext = sslContext.get();
  config.tokenFactory = CreateSamlTokenFactory(nullptr);
  EXPECT_NE(CreateSecurityTokenService(config), nullptr);
  config.holderOfKeyConfig = GetParam().config();
  EXPECT_EQ(
      MessageOf<Tarnik::InvalidArgumentException>([&] { CreateSecurityTokenService(config); }),
      GetParam().message);
}

TEST_P(BrokenConfigTest, IsRefusedOverTheCallersUserAgentToo) {
  SecurityTokenServiceConfigEx config;
  config.url = "/sts";
  config.tokenFactory = CreateSamlTokenFactory(nullptr);
  config.holderOfKeyConfig = GetParam().config();
  EXPECT_EQ(
      MessageOf<Tarnik::InvalidArgumentException>([&] { CreateSecurityTokenService(config); }),
      GetParam().message);
}

constexpr char kNotRsa[] =
    "HolderOfKeyConfig: the key must be an RSA key, since requests are signed with RSA-SHA256.";
constexpr char kNotTheCertificates[] =
    "HolderOfKeyConfig: the private key does not belong to the certificate.";

INSTANTIATE_TEST_SUITE_P(
    Configs, BrokenConfigTest,
    testing::Values(BrokenCase{"Empty", [] { return HolderOfKeyConfig(); },
                               "HolderOfKeyConfig: the certificate must not be null."},
                    BrokenCase{"WithoutCertificate", WithoutCertificate,
                               "HolderOfKeyConfig: the certificate must not be null."},
                    BrokenCase{"WithoutKey", WithoutKey,
                               "HolderOfKeyConfig: the private key must not be null."},
                    BrokenCase{"Mismatched", Mismatched, kNotTheCertificates},
                    BrokenCase{"MismatchedInKind", MismatchedInKind, kNotTheCertificates},
                    BrokenCase{"EcP256", OfType<DevSts::KeyType::EcP256>, kNotRsa},
                    BrokenCase{"EcP384", OfType<DevSts::KeyType::EcP384>, kNotRsa},
                    BrokenCase{"Rsa1024", OfType<DevSts::KeyType::Rsa1024>,
                               "HolderOfKeyConfig: the RSA key must have at least 2048 bits."}),
    [](const auto& tested) { return tested.param.name; });

class HolderOfKeyConfigTest : public HolderOfKeyTest {};

TEST_F(HolderOfKeyConfigTest, LongerRsaKeysAreAccepted) {
  const DevSts::Credential credential = CredentialOf(DevSts::KeyType::Rsa3072);
  EXPECT_TRUE(IsBoundTo(*HolderService(credential)->AcquireToken(kUser, kPassword, TenMinutes()),
                        credential));
}

struct PeriodCase {
  const char* name;
  seconds notBefore;
  seconds notAfter;
  /// The end of the message; empty if the request is sent.
  const char* reason;
};

class CertificatePeriodTest : public HolderOfKeyTest,
                              public testing::WithParamInterface<PeriodCase> {
 protected:
  CertificatePeriodTest()
      : credential_(HolderValidBetween(GetParam().notBefore, GetParam().notAfter)),
        service_(HolderService(credential_)) {
    arguments_.token = AcquireBound();
    Sts().ClearRequests();
  }

  DevSts::Credential credential_;
  std::shared_ptr<SecurityTokenService> service_;
  Arguments arguments_;
};

class OutOfPeriodTest : public CertificatePeriodTest {};

TEST_P(OutOfPeriodTest, FailsEveryRequestThatCarriesTheCertificateAndSendsNothing) {
  const auto certificate = ConfigOf(credential_).certificate;
  const std::string expected =
      "The holder-of-key certificate of `CN=holder' " + std::string(GetParam().reason) +
      (GetParam().notAfter < seconds(0) ? certificate->NotAfter() : certificate->NotBefore())
          .ToString();
  for (const Operation operation :
       {Operation::Password, Operation::Certificate, Operation::Renew}) {
    const Outcome outcome = CallNow(operation, *service_, arguments_);
    EXPECT_EQ(outcome.errorClass, typeid(Tarnik::InvalidStateException)) << operation;
    EXPECT_EQ(outcome.message, expected) << operation;
  }
  EXPECT_THAT(Sts().Requests(), IsEmpty());
}

TEST_P(OutOfPeriodTest, DoesNotAffectRequestsWithoutTheCertificate) {
  const Outcome byToken = CallNow(Operation::Token, *service_, arguments_);
  ASSERT_TRUE(byToken.IsSuccess()) << byToken.message;
  EXPECT_EQ(byToken.token->ConfirmationType(), HOLDER_OF_KEY);
  EXPECT_EQ(CallNow(Operation::Validate, *service_, arguments_).verdict, true);
  arguments_.spec.confirmation = CONFIRMATION_BEARER;
  const Outcome outcome = CallNow(Operation::Password, *service_, arguments_);
  ASSERT_TRUE(outcome.IsSuccess()) << outcome.message;
  EXPECT_EQ(outcome.token->ConfirmationType(), BEARER);
}

INSTANTIATE_TEST_SUITE_P(
    Periods, OutOfPeriodTest,
    testing::Values(PeriodCase{"LongExpired", hours(-48), hours(-24), "expired at "},
                    PeriodCase{"JustExpired", hours(-1), seconds(-630), "expired at "},
                    PeriodCase{"FarAhead", hours(24), hours(48), "is not valid before "},
                    PeriodCase{"JustAhead", seconds(660), hours(1), "is not valid before "}),
    [](const auto& tested) { return tested.param.name; });

// Clocks differ, so shortly before and after the period the decision is left to the service.
class NearPeriodTest : public CertificatePeriodTest {};

TEST_P(NearPeriodTest, IsLeftToTheService) {
  for (const Operation operation : {Operation::Password, Operation::Certificate}) {
    const Outcome outcome = CallNow(operation, *service_, arguments_);
    EXPECT_EQ(outcome.errorClass, typeid(InvalidCredentialsException)) << operation;
    EXPECT_EQ(outcome.message,
              "Authentication failed: The certificate has expired or is not yet valid")
        << operation;
  }
  EXPECT_THAT(Sts().Requests(), SizeIs(2));
}

INSTANTIATE_TEST_SUITE_P(Periods, NearPeriodTest,
                         testing::Values(PeriodCase{"Expired", hours(-1), seconds(-540), ""},
                                         PeriodCase{"Ahead", seconds(540), hours(1), ""}),
                         [](const auto& tested) { return tested.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
