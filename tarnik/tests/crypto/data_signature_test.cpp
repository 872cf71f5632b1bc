#include <algorithm>
#include <atomic>
#include <cstddef>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gtest/gtest.h>
#include <openssl/err.h>
#include <openssl/pem.h>
#include <openssl/rsa.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/data_signature.h>

#include "support/openssl.h"
#include "support/test_certificates.h"
#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;
using Bytes = std::vector<unsigned char>;

constexpr const char* kData = "possession";

OpenSsl::OwnedKey CopyOf(EVP_PKEY* key) {
  EVP_PKEY_up_ref(key);
  return OpenSsl::OwnedKey(key);
}

OpenSsl::OwnedKey MakePssKey(const char* hash = "") {
  const OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA-PSS", nullptr));
  EVP_PKEY* key = nullptr;
  Require(EVP_PKEY_keygen_init(context.get()) == 1 &&
              EVP_PKEY_CTX_set_rsa_keygen_bits(context.get(), 2048) == 1 &&
              (*hash == '\0' ||
               (EVP_PKEY_CTX_ctrl_str(context.get(), "rsa_pss_keygen_md", hash) == 1 &&
                EVP_PKEY_CTX_ctrl_str(context.get(), "rsa_pss_keygen_mgf1_md", hash) == 1)) &&
              EVP_PKEY_generate(context.get(), &key) == 1,
          "RSA-PSS key");
  return OpenSsl::OwnedKey(key);
}

/// A key of the library and a certificate for it.
struct Signer {
  explicit Signer(OpenSsl::OwnedKey made) : key(std::move(made)) {
    const OpenSsl::OwnedBio memory(BIO_new(BIO_s_mem()));
    Require(PEM_write_bio_PrivateKey(memory.get(), key.get(), nullptr, nullptr, 0, nullptr,
                                     nullptr) == 1,
            "PEM");
    char* text = nullptr;
    const long length = BIO_get_mem_data(memory.get(), &text);
    privateKey = CreatePrivateKeyFromPem({text, static_cast<std::size_t>(length)});
    certificate = MakeCertificate({.key = key.get()});
  }

  OpenSsl::OwnedKey key;
  Ref<const PrivateKey> privateKey;
  Ref<const Certificate> certificate;
};

enum KeyKind { kRsa, kPss, kP256, kP384, kP521, kKeyKinds };

const Signer& SharedSigner(KeyKind kind) {
  static const Signer signers[kKeyKinds]{Signer(CopyOf(SharedRsaKey())), Signer(MakePssKey()),
                                         Signer(MakeEcKey("P-256")), Signer(MakeEcKey("P-384")),
                                         Signer(MakeEcKey("P-521"))};
  return signers[kind];
}

/// By OpenSSL's own function, which shares no code with the library.
Bytes IndependentSignature(EVP_PKEY* key, const EVP_MD* hash, bool isPss,
                           const std::string& data = kData,
                           int saltLength = RSA_PSS_SALTLEN_DIGEST) {
  const OpenSsl::OwnedDigestContext context(EVP_MD_CTX_new());
  EVP_PKEY_CTX* keyContext = nullptr;
  Require(EVP_DigestSignInit(context.get(), &keyContext, hash, nullptr, key) == 1, "signature");
  Require(!isPss || (EVP_PKEY_CTX_set_rsa_padding(keyContext, RSA_PKCS1_PSS_PADDING) == 1 &&
                     EVP_PKEY_CTX_set_rsa_pss_saltlen(keyContext, saltLength) == 1),
          "PSS");
  Bytes signature(512);
  std::size_t length = signature.size();
  Require(EVP_DigestSign(context.get(), signature.data(), &length,
                         reinterpret_cast<const unsigned char*>(data.data()), data.size()) == 1,
          "signature");
  signature.resize(length);
  return signature;
}

struct AlgorithmCase {
  const char* name;
  SignatureAlgorithm algorithm;
  const EVP_MD* (*hash)();
  bool isPss;
  std::vector<KeyKind> fitting;
};

const std::vector<AlgorithmCase>& AllAlgorithms() {
  using A = SignatureAlgorithm;
  static const std::vector<KeyKind> ec{kP256, kP384, kP521};
  static const std::vector<AlgorithmCase> cases{
      {"RsaPkcs1Sha256", A::kRsaPkcs1Sha256, EVP_sha256, false, {kRsa}},
      {"RsaPkcs1Sha384", A::kRsaPkcs1Sha384, EVP_sha384, false, {kRsa}},
      {"RsaPkcs1Sha512", A::kRsaPkcs1Sha512, EVP_sha512, false, {kRsa}},
      {"RsaPssSha256", A::kRsaPssSha256, EVP_sha256, true, {kRsa, kPss}},
      {"RsaPssSha384", A::kRsaPssSha384, EVP_sha384, true, {kRsa, kPss}},
      {"RsaPssSha512", A::kRsaPssSha512, EVP_sha512, true, {kRsa, kPss}},
      {"EcdsaSha256", A::kEcdsaSha256, EVP_sha256, false, ec},
      {"EcdsaSha384", A::kEcdsaSha384, EVP_sha384, false, ec},
      {"EcdsaSha512", A::kEcdsaSha512, EVP_sha512, false, ec}};
  return cases;
}

class DataSignatureTest : public testing::TestWithParam<AlgorithmCase> {
 protected:
  bool Verify(const Signer& signer, const Bytes& signature, const std::string& data = kData) const {
    return VerifyData(*signer.certificate, GetParam().algorithm, data, signature);
  }
};

TEST_P(DataSignatureTest, IsVerifiedIfAnotherProgramMadeIt) {
  for (const KeyKind kind : GetParam().fitting) {
    const Signer& signer = SharedSigner(kind);
    const Bytes signature =
        IndependentSignature(signer.key.get(), GetParam().hash(), GetParam().isPss);
    EXPECT_TRUE(Verify(signer, signature)) << kind;
    EXPECT_FALSE(Verify(signer, signature, "possessioN")) << kind;
    EXPECT_FALSE(Verify(signer, signature, "")) << kind;
  }
}

TEST_P(DataSignatureTest, IsVerifiedIfTheLibraryMadeIt) {
  for (const KeyKind kind : GetParam().fitting) {
    const Signer& signer = SharedSigner(kind);
    for (const std::string& data :
         {std::string(), std::string(kData), std::string("a\0b", 3), std::string(100000, 'x')}) {
      const Bytes signature = SignData(*signer.privateKey, GetParam().algorithm, data);
      EXPECT_TRUE(Verify(signer, signature, data)) << kind;
      EXPECT_FALSE(Verify(signer, signature, data + '\0')) << kind;
    }
  }
}

TEST_P(DataSignatureTest, IsNotOneOfAnotherKeyOrAlgorithm) {
  for (const KeyKind kind : GetParam().fitting) {
    const Bytes signature = SignData(*SharedSigner(kind).privateKey, GetParam().algorithm, kData);
    for (const AlgorithmCase& other : AllAlgorithms()) {
      for (const KeyKind otherKind : other.fitting) {
        const bool isSame = other.algorithm == GetParam().algorithm && kind == otherKind;
        EXPECT_EQ(
            VerifyData(*SharedSigner(otherKind).certificate, other.algorithm, kData, signature),
            isSame)
            << other.name << " " << otherKind;
      }
    }
  }
}

TEST_P(DataSignatureTest, HasNoBitThatCanBeFlipped) {
  const Signer& signer = SharedSigner(GetParam().fitting.front());
  const Bytes signature = SignData(*signer.privateKey, GetParam().algorithm, kData);
  // Each bit at both ends, where the form is, and one of each byte.
  for (std::size_t bit = 0; bit < 8 * signature.size(); ++bit) {
    const std::size_t byte = bit / 8;
    if (byte < 8 || byte + 4 > signature.size() || bit % 8 == byte % 8) {
      Bytes changed = signature;
      changed[byte] ^= static_cast<unsigned char>(1U << (bit % 8));
      ASSERT_FALSE(Verify(signer, changed)) << bit;
    }
  }
}

TEST_P(DataSignatureTest, HasOneLength) {
  const Signer& signer = SharedSigner(GetParam().fitting.front());
  const Bytes signature = SignData(*signer.privateKey, GetParam().algorithm, kData);
  for (std::size_t length = 0; length < signature.size(); ++length) {
    ASSERT_FALSE(Verify(signer, {signature.begin(), signature.begin() + length})) << length;
  }
  Bytes longer = signature;
  longer.push_back(0);
  EXPECT_FALSE(Verify(signer, longer));
  longer = signature;
  longer.insert(longer.begin(), 0);
  EXPECT_FALSE(Verify(signer, longer));
  EXPECT_FALSE(Verify(signer, Bytes(10000, 0x30)));
}

TEST_P(DataSignatureTest, NeedsAKeyOfItsType) {
  for (int kind = 0; kind < kKeyKinds; ++kind) {
    const auto& fitting = GetParam().fitting;
    const bool fits = std::find(fitting.begin(), fitting.end(), kind) != fitting.end();
    const Signer& signer = SharedSigner(static_cast<KeyKind>(kind));
    const auto verify = [&] { Verify(signer, Bytes(256, 1)); };
    const auto sign = [&] { SignData(*signer.privateKey, GetParam().algorithm, kData); };
    EXPECT_EQ(ThrownMessage<CryptoException>(verify, "fits") == "fits", fits) << kind;
    EXPECT_EQ(ThrownMessage<CryptoException>(sign, "fits") == "fits", fits) << kind;
  }
}

INSTANTIATE_TEST_SUITE_P(Algorithms, DataSignatureTest, testing::ValuesIn(AllAlgorithms()),
                         [](const auto& tested) { return tested.param.name; });

std::string VerifyError(const OpenSsl::OwnedKey& key, SignatureAlgorithm algorithm) {
  const auto certificate = MakeCertificate({.key = key.get()});
  return ThrownMessage<CryptoException>([&] { VerifyData(*certificate, algorithm, "", {}); });
}

TEST(DataSignatureKeyTest, IsNamedWhenItDoesNotFit) {
  EXPECT_EQ(VerifyError(CopyOf(SharedRsaKey()), SignatureAlgorithm::kEcdsaSha256),
            "The certificate's key is an RSA key; the signature algorithm needs an EC key.");
  EXPECT_EQ(VerifyError(CopyOf(SharedSigner(kPss).key.get()), SignatureAlgorithm::kRsaPkcs1Sha256),
            "The certificate's key is an RSA-PSS key; the signature algorithm needs an RSA key.");
  EXPECT_EQ(VerifyError(MakeKey("ED25519"), SignatureAlgorithm::kRsaPssSha256),
            "The certificate's key is neither an RSA nor an EC key; the signature algorithm needs "
            "an RSA or RSA-PSS key.");
}

TEST(DataSignatureKeyTest, IsRefusedWhenItIsWeak) {
  const OpenSsl::OwnedKey shortKey = MakeRsaKey(2040);
  for (const SignatureAlgorithm algorithm :
       {SignatureAlgorithm::kRsaPkcs1Sha256, SignatureAlgorithm::kRsaPssSha256}) {
    EXPECT_EQ(VerifyError(CopyOf(shortKey.get()), algorithm),
              "The certificate's key has 2040 bits; at least 2048 are needed.");
  }
  for (const char* curve : {"secp256k1", "P-224"}) {
    EXPECT_EQ(VerifyError(MakeEcKey(curve), SignatureAlgorithm::kEcdsaSha256),
              "The certificate's key is not on the curve P-256, P-384 or P-521.");
  }
  const Signer weak(MakeRsaKey(1024));
  EXPECT_EQ(ThrownMessage<CryptoException>([&weak] {
              SignData(*weak.privateKey, SignatureAlgorithm::kRsaPkcs1Sha256, kData);
            }),
            "The private key has 1024 bits; at least 2048 are needed.");
}

TEST(DataSignatureKeyTest, MayBeRestrictedToOneHash) {
  const Signer signer(MakePssKey("SHA256"));
  const Bytes signature = SignData(*signer.privateKey, SignatureAlgorithm::kRsaPssSha256, kData);
  EXPECT_TRUE(VerifyData(*signer.certificate, SignatureAlgorithm::kRsaPssSha256, kData, signature));
  EXPECT_THROW(VerifyData(*signer.certificate, SignatureAlgorithm::kRsaPssSha384, kData, signature),
               CryptoException);
  EXPECT_THROW(SignData(*signer.privateKey, SignatureAlgorithm::kRsaPssSha384, kData),
               CryptoException);
}

TEST(DataSignaturePssTest, HasASaltOfTheLengthOfTheHash) {
  const Signer& signer = SharedSigner(kRsa);
  for (const auto& [saltLength, isAccepted] :
       {std::pair(32, true), std::pair(31, false), std::pair(33, false), std::pair(0, false)}) {
    const Bytes signature =
        IndependentSignature(signer.key.get(), EVP_sha256(), true, kData, saltLength);
    EXPECT_EQ(VerifyData(*signer.certificate, SignatureAlgorithm::kRsaPssSha256, kData, signature),
              isAccepted)
        << saltLength;
  }
}

TEST(DataSignatureAlgorithmTest, IsOneThatIsDefined) {
  const Signer& signer = SharedSigner(kRsa);
  for (const int value : {-1, 9, 1000}) {
    const auto algorithm = static_cast<SignatureAlgorithm>(value);
    EXPECT_THROW(VerifyData(*signer.certificate, algorithm, kData, {}), InvalidArgumentException);
    EXPECT_THROW(SignData(*signer.privateKey, algorithm, kData), InvalidArgumentException);
  }
}

TEST(DataSignatureAlgorithmTest, LeavesTheErrorQueueUnchanged) {
  SharedSigner(kRsa);  // making the keys empties the queue
  ERR_clear_error();
  ERR_raise(ERR_LIB_USER, 77);
  const unsigned long before = ERR_peek_error();
  for (const AlgorithmCase& each : AllAlgorithms()) {
    const Signer& signer = SharedSigner(each.fitting.front());
    Bytes signature = SignData(*signer.privateKey, each.algorithm, kData);
    signature.back() ^= 1;
    EXPECT_FALSE(VerifyData(*signer.certificate, each.algorithm, kData, signature));
  }
  EXPECT_EQ(ERR_peek_last_error(), before);
  ERR_clear_error();
}

TEST(DataSignatureAlgorithmTest, MayBeUsedByManyThreadsAtOnce) {
  const Signer& signer = SharedSigner(kP256);
  const Bytes signature = SignData(*signer.privateKey, SignatureAlgorithm::kEcdsaSha256, kData);
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&] {
      for (int i = 0; i < 20; ++i) {
        const auto verify = [&](const char* data) {
          return VerifyData(*signer.certificate, SignatureAlgorithm::kEcdsaSha256, data, signature);
        };
        wrong += verify(kData) && !verify("other") ? 0 : 1;
      }
    });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(wrong, 0);
}

}  // namespace
}  // namespace Tarnik::Testing
