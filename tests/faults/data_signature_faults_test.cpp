#include <cstddef>
#include <new>
#include <optional>
#include <vector>

#include <gtest/gtest.h>

#include <devsts/certificates.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/data_signature.h>
#include <tarnik/crypto/digest.h>
#include <tarnik/crypto/private_key.h>

#include "faults/fault_injection.h"

// If a call fails while data is verified or signed, a signature that does not match is never valid,
// one that matches is never invalid, and a digest is never wrong: the failure is reported.
namespace SsoClient::Testing {
namespace {

using DevSts::KeyType;
using Tarnik::Crypto::CreateCertificatesFromPem;
using Tarnik::Crypto::CreatePrivateKeyFromPem;
using Tarnik::Crypto::CryptoException;
using Tarnik::Crypto::Sha256;
using Tarnik::Crypto::SignatureAlgorithm;
using Tarnik::Crypto::SignData;
using Tarnik::Crypto::VerifyData;

constexpr const char* kSigned = "signed data";
constexpr const char* kOther = "other data";

struct DataCase {
  const char* name;
  KeyType keyType;
  SignatureAlgorithm algorithm;
};

/// What `action` returns, or nothing when the failure is reported.
template <class Action>
auto WithoutFailure(Action action) -> std::optional<decltype(action())> {
  try {
    return action();
  } catch (const CryptoException&) {
  } catch (const std::bad_alloc&) {
  }
  return std::nullopt;
}

class DataSignatureFaultsTest : public testing::TestWithParam<DataCase> {
 protected:
  DataSignatureFaultsTest() {
    DevSts::CertificateSpec spec;
    spec.commonName = "signer";
    spec.keyType = GetParam().keyType;
    signer_ = DevSts::MakeCertificate(spec);
    signature_ =
        SignData(*CreatePrivateKeyFromPem(signer_.privateKeyPem), GetParam().algorithm, kSigned);
  }

  /// Verifies `data` with each call of `kind` failing in turn; returns the number of calls. The
  /// result is never `wrong`.
  std::size_t FailEachCall(FaultKind kind, int result, const char* data, bool wrong) {
    const auto certificate = CreateCertificatesFromPem(signer_.certificatePem).front();
    for (std::size_t index = 0;; ++index) {
      const InjectedFault fault(kind, index, result);
      const auto isValid = WithoutFailure(
          [&] { return VerifyData(*certificate, GetParam().algorithm, data, signature_); });
      EXPECT_NE(isValid, std::optional<bool>(wrong)) << index;
      if (!fault.HasHappened()) {
        EXPECT_EQ(isValid, std::optional<bool>(!wrong));
        return index;
      }
    }
  }

  DevSts::Credential signer_;
  std::vector<unsigned char> signature_;
};

TEST_P(DataSignatureFaultsTest, NeverMakeAForgeryValid) {
  for (const FaultKind kind :
       {FaultKind::kAllocation, FaultKind::kOpenSslAllocation, FaultKind::kCrypto}) {
    EXPECT_GT(FailEachCall(kind, 0, kOther, true), 0U);
  }
  EXPECT_GT(FailEachCall(FaultKind::kCrypto, -1, kOther, true), 0U);
}

TEST_P(DataSignatureFaultsTest, NeverMakeASignatureInvalidWhenMemoryRunsOut) {
  for (const FaultKind kind : {FaultKind::kAllocation, FaultKind::kOpenSslAllocation}) {
    EXPECT_GT(FailEachCall(kind, 0, kSigned, false), 0U);
  }
}

TEST_P(DataSignatureFaultsTest, MakeNoWrongSignature) {
  const auto key = CreatePrivateKeyFromPem(signer_.privateKeyPem);
  const auto certificate = CreateCertificatesFromPem(signer_.certificatePem).front();
  std::size_t refused = 0;
  for (std::size_t index = 0; index < 200; ++index) {
    std::optional<std::vector<unsigned char>> made;
    {
      const InjectedFault fault(FaultKind::kOpenSslAllocation, index % 20);
      made = WithoutFailure([&] { return SignData(*key, GetParam().algorithm, kSigned); });
    }
    refused += made ? 0 : 1;
    EXPECT_TRUE(!made || VerifyData(*certificate, GetParam().algorithm, kSigned, *made)) << index;
  }
  EXPECT_GT(refused, 0U);
}

INSTANTIATE_TEST_SUITE_P(
    Schemes, DataSignatureFaultsTest,
    testing::Values(DataCase{"RsaPkcs1", KeyType::Rsa2048, SignatureAlgorithm::kRsaPkcs1Sha256},
                    DataCase{"RsaPss", KeyType::Rsa2048, SignatureAlgorithm::kRsaPssSha256},
                    DataCase{"Ecdsa", KeyType::EcP256, SignatureAlgorithm::kEcdsaSha256}),
    [](const auto& tested) { return tested.param.name; });

TEST(DigestFaultsTest, AreReportedAndForgotten) {
  const auto expected = Sha256(kSigned);
  std::size_t calls = 0;
  for (bool happened = true; happened; ++calls) {
    {
      const InjectedFault fault(FaultKind::kCrypto, calls);
      const auto digest = WithoutFailure([] { return Sha256(kSigned); });
      happened = fault.HasHappened();
      EXPECT_EQ(digest.has_value(), !happened) << calls;
      EXPECT_TRUE(digest.value_or(expected) == expected);
    }
    EXPECT_TRUE(Sha256(kSigned) == expected);
  }
  EXPECT_EQ(calls, 4U);  // begin, update, end, and once without a fault
}

}  // namespace
}  // namespace SsoClient::Testing
