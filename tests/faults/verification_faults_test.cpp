#include <cstddef>
#include <new>
#include <string>
#include <tuple>
#include <utility>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <devsts/certificates.h>
#include <devsts/xml_security.h>
#include <ssoclient/exceptions.h>
#include <ssoclient/saml_token.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/ref.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "faults/fault_injection.h"
#include "support/assertion_text.h"
#include "support/one_key_resolver.h"

// If an allocation within OpenSSL fails while a token is verified, the token is accepted or the
// failure is reported; a good token is never said to have been tampered with.
namespace SsoClient::Testing {
namespace {

using Tarnik::Testing::OneKeyResolver;
using Tarnik::Xml::Security::KeyInfoResolver;

constexpr const char* kTampered =
    "Failed to verify signature: token might have been tampered with.";

using DevSts::KeyType;
using DevSts::SignatureAlgorithm;

struct SchemeCase {
  const char* name;
  KeyType keyType;
  SignatureAlgorithm algorithm;
};

class VerificationFaultsTest : public testing::TestWithParam<SchemeCase> {
 protected:
  VerificationFaultsTest() {
    DevSts::CertificateSpec spec;
    spec.commonName = "signer";
    spec.keyType = GetParam().keyType;
    signer_ = DevSts::MakeCertificate(spec);
    AssertionText assertion;
    assertion.signature.clear();
    DevSts::SignOptions options;
    options.signature = GetParam().algorithm;
    xml_ =
        DevSts::SignXml(assertion.ToXml(), signer_.privateKeyPem, signer_.certificatePem, options);
  }

  /// The message of reading the token while the allocation with this number fails, empty when it
  /// is accepted; and whether there was such an allocation. The key is new, so that everything that
  /// OpenSSL does for a key is done each time.
  std::pair<std::string, bool> ReadWithFault(std::size_t index) {
    const auto key = Tarnik::Crypto::CreatePrivateKeyFromPem(signer_.privateKeyPem);
    const auto resolver = Tarnik::MakeRef<const OneKeyResolver>(key->GetPublicKey());
    const InjectedFault fault(FaultKind::kOpenSslAllocation, index);
    return {Message(*resolver), fault.HasHappened()};
  }

  std::string Message(const KeyInfoResolver& resolver) const {
    try {
      CreateSamlToken(xml_, &resolver);
      return "";
    } catch (const InvalidSignatureException& error) {
      return error.Message();
    } catch (const std::bad_alloc&) {
      return "bad_alloc";
    }
  }

  DevSts::Credential signer_;
  std::string xml_;
};

TEST_P(VerificationFaultsTest, NeverSayThatAGoodTokenWasTamperedWith) {
  std::size_t failures = 0;
  std::size_t explained = 0;
  std::size_t accepted = 0;
  for (bool happened = true; happened; ++failures) {
    std::string message;
    std::tie(message, happened) = ReadWithFault(failures);
    EXPECT_THAT(message, testing::AnyOf("", testing::StartsWith("Signature verification error. ")))
        << failures;
    explained += message.find("not enough memory") == std::string::npos ? 0 : 1;
    accepted += message.empty() ? 1 : 0;
  }
  // OpenSSL does not report each failed allocation as such, and some it can do without.
  EXPECT_GT(failures, 30U);
  EXPECT_GT(explained, failures / 2);
  EXPECT_GT(accepted, 0U);
}

TEST_P(VerificationFaultsTest, NeverMakeATokenValidThatWasTamperedWith) {
  char& digit = xml_.at(xml_.find("<ds:DigestValue>") + std::string("<ds:DigestValue>").size());
  digit = digit == 'A' ? 'B' : 'A';
  std::size_t failures = 0;
  bool wasRecognised = false;
  for (bool happened = true; happened; ++failures) {
    std::string message;
    std::tie(message, happened) = ReadWithFault(failures);
    EXPECT_NE(message, "") << failures;
    wasRecognised = message == kTampered;
  }
  EXPECT_TRUE(wasRecognised);
}

INSTANTIATE_TEST_SUITE_P(
    Schemes, VerificationFaultsTest,
    testing::Values(SchemeCase{"RsaPkcs1", KeyType::Rsa2048, SignatureAlgorithm::RsaSha256},
                    SchemeCase{"RsaPss", KeyType::Rsa2048, SignatureAlgorithm::RsaPssSha256},
                    SchemeCase{"Ecdsa", KeyType::EcP256, SignatureAlgorithm::EcdsaSha256}),
    [](const auto& scheme) { return scheme.param.name; });

}  // namespace
}  // namespace SsoClient::Testing
