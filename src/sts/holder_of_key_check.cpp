#include "sts/holder_of_key_check.h"

#include <string>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>

#include "support/clock_tolerance.h"

namespace SsoClient {

namespace {

using Tarnik::Crypto::KeyAlgorithm;
using Tarnik::System::DateTime;

constexpr int kMinRsaBits = 2048;  // NIST SP 800-131A

void Require(bool isGood, const char* complaint) {
  if (!isGood) {
    throw Tarnik::InvalidArgumentException(std::string("HolderOfKeyConfig: ") + complaint);
  }
}

bool BelongTogether(const HolderOfKeyConfig& config) {
  try {
    return config.privateKey->Matches(*config.certificate);
  } catch (const Tarnik::Crypto::CryptoException& error) {
    throw Tarnik::InvalidArgumentException("HolderOfKeyConfig: the certificate cannot be used: " +
                                           error.Message());
  }
}

DateTime SecondsLater(const DateTime& time, long seconds) {
  return Tarnik::System::DateTimeFromUtc(
      Tarnik::System::SaturatingAdd(time.GetUtcTime(), seconds * 1'000'000), false);
}

std::string Describe(const Tarnik::Crypto::Certificate& certificate) {
  return "The holder-of-key certificate of `" + certificate.SubjectName() + "'";
}

}  // namespace

void CheckHolderOfKeyConfig(const boost::optional<HolderOfKeyConfig>& config) {
  if (!config) {
    return;
  }
  Require(config->certificate != nullptr, "the certificate must not be null.");
  Require(config->privateKey != nullptr, "the private key must not be null.");
  Require(BelongTogether(*config), "the private key does not belong to the certificate.");
  const auto key = config->privateKey->GetPublicKey();
  // The key may be of the caller's own making.
  Require(key != nullptr, "the private key has no public half.");
  Require(key->Algorithm() == KeyAlgorithm::kRsa,
          "the key must be an RSA key, since requests are signed with RSA-SHA256.");
  Require(key->Bits() >= kMinRsaBits, "the RSA key must have at least 2048 bits.");
}

void CheckPeriodOfValidity(const Tarnik::Crypto::Certificate& certificate, const DateTime& now) {
  if (now < SecondsLater(certificate.NotBefore(), -kDefaultClockToleranceSec)) {
    throw Tarnik::InvalidStateException(Describe(certificate) + " is not valid before " +
                                        certificate.NotBefore().ToString());
  }
  if (now > SecondsLater(certificate.NotAfter(), kDefaultClockToleranceSec)) {
    throw Tarnik::InvalidStateException(Describe(certificate) + " expired at " +
                                        certificate.NotAfter().ToString());
  }
}

}  // namespace SsoClient
