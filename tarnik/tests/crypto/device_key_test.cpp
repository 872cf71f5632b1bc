#include <memory>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include "support/algorithm_uris.h"
#include "support/software_tpm.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;

constexpr const char* kPin = "4711";
constexpr const char* kRsaKey = "handle:0x81000001?pass";
constexpr const char* kEcKey = "handle:0x81000002?pass";

/// Keys in a TPM, used through OpenSSL's provider for TPMs.
class DeviceKeyTest : public testing::Test {
 protected:
  static void SetUpTestSuite() {
    if (!SoftwareTpm::IsInstalled()) {
      return;
    }
    const std::string attributes = "fixedtpm|fixedparent|sensitivedataorigin|userwithauth|sign";
    tpm_ = std::make_unique<SoftwareTpm>();
    tpm_->MakeKey("rsa2048", attributes + "|decrypt", kPin, "0x81000001");
    tpm_->MakeKey("ecc256", attributes, kPin, "0x81000002");
  }
  static void TearDownTestSuite() { tpm_.reset(); }

  void SetUp() override {
    if (tpm_ == nullptr) {
      GTEST_SKIP() << "swtpm and tpm2-tools are not installed";
    }
  }

  static std::string Sign(const std::string& uri, const std::string& method,
                          const std::string& pin = "") {
    return tpm_->Run(std::string(TARNIK_DEVICE_KEY_PROBE) + " '" + uri + "' '" + method + "' " +
                     pin);
  }

  static inline std::unique_ptr<SoftwareTpm> tpm_;
};

TEST_F(DeviceKeyTest, SignsAfterAskingForThePinOnce) {
  EXPECT_EQ(Sign(kRsaKey, kRsaSha256, kPin), "verified, asked 1 times\n");
  EXPECT_EQ(Sign(kEcKey, kEcdsaSha256, kPin), "verified, asked 1 times\n");
}

TEST_F(DeviceKeyTest, IsNotLoadedWithoutAPin) {
  EXPECT_EQ(Sign(kRsaKey, kRsaSha256), "The private key needs a passphrase, and none was given.\n");
}

TEST_F(DeviceKeyTest, DoesNotSignWithAWrongPin) {
  // Then follows OpenSSL's reason, which depends on its version.
  EXPECT_THAT(Sign(kRsaKey, kRsaSha256, "1234"),
              testing::MatchesRegex("The signature cannot be made: [a-z ]+\\.\n"));
}

TEST_F(DeviceKeyTest, IsCheckedAgainstTheAlgorithmBeforeTheDeviceIsUsed) {
  EXPECT_EQ(Sign(kEcKey, kRsaSha256, kPin),
            std::string("The private key is an EC key; the signature algorithm '") + kRsaSha256 +
                "' needs an RSA key.\n");
}

TEST_F(DeviceKeyTest, IsNotFoundUnderAnotherHandle) {
  EXPECT_EQ(Sign("handle:0x81000009", kRsaSha256, kPin),
            "The URI 'handle:' gives no private key: cannot load key.\n");
}

}  // namespace
}  // namespace Tarnik::Testing
