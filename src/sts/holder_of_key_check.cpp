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

void Require(bool condition, const char* complaint) {
  if (!condition) {
    throw Tarnik::InvalidArgumentException(std::string("HolderOfKeyConfig: ") + complaint);
  }
}

bool KeyMatchesCertificate(const HolderOfKeyConfig& config) {
  try {
    return config.privateKey->Matches(*config.certificate);
  } catch (const Tarnik::Crypto::CryptoException& error) {
    throw Tarnik::InvalidArgumentException("HolderOfKeyConfig: the certificate cannot be used: " +
                                           error.Message());
  }
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
  Require(KeyMatchesCertificate(*config), "the private key does not belong to the certificate.");
  const auto key = config->privateKey->GetPublicKey();
  // The caller may implement the key.
  Require(key != nullptr, "the private key has no public half.");
  Require(key->Algorithm() == KeyAlgorithm::kRsa,
          "the key must be an RSA key, since requests are signed with RSA-SHA256.");
  Require(key->Bits() >= kMinRsaBits, "the RSA key must have at least 2048 bits.");
}

void CheckPeriodOfValidity(const Tarnik::Crypto::Certificate& certificate, const DateTime& now) {
  if (now < AddSeconds(certificate.NotBefore(), -kDefaultClockToleranceSec)) {
    throw Tarnik::InvalidStateException(Describe(certificate) + " is not valid before " +
                                        certificate.NotBefore().ToString());
  }
  if (now > AddSeconds(certificate.NotAfter(), kDefaultClockToleranceSec)) {
    throw Tarnik::InvalidStateException(Describe(certificate) + " expired at " +
                                        certificate.NotAfter().ToString());
  }
}

}  // namespace SsoClient
