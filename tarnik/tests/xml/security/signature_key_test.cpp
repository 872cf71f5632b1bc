#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/public_key.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/one_key_resolver.h"
#include "support/openssl.h"
#include "support/signed_documents.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using DevSts::KeyType;
using DevSts::SignatureAlgorithm;
using DevSts::SignOptions;

constexpr const char* kWrongKeyType =
    "refused: The trusted key is not of the type of the signature algorithm.";

std::string NoTrustedKeyFor(const DevSts::Credential& signer) {
  const auto certificate = CertificateOf(signer);
  return "refused: There is no trusted key for the signature, whose certificate is of '" +
         certificate->SubjectName() + "', issued by '" + certificate->IssuerName() +
         "' with the serial number '" + certificate->SerialNumber() + "'.";
}

TEST(SignatureKeyTest, IsNeverTakenFromTheMessage) {
  const std::string text = Signed({}, kUnsigned, Stranger());
  ASSERT_TRUE(DevSts::VerifyXml(text, Stranger().certificatePem));
  EXPECT_EQ(Verdict(text, Stranger()), "valid");
  EXPECT_EQ(Verdict(text, Signer()), NoTrustedKeyFor(Stranger()));

  SignOptions bareKey;
  bareKey.keyInfo = DevSts::KeyInfoContent::KeyValue;
  EXPECT_EQ(Verdict(Signed(bareKey, kUnsigned, Stranger()), Signer()), "invalid");
  EXPECT_EQ(Verdict(Signed(bareKey), Signer()), "valid");

  SignOptions noKey;
  noKey.keyInfo = DevSts::KeyInfoContent::None;
  EXPECT_EQ(Verdict(Signed(noKey, kUnsigned, Stranger()), Signer()), "invalid");
  EXPECT_EQ(Verdict(Signed(noKey), Signer()), "valid");
}

TEST(SignatureKeyTest, OfAStrangerWithTheTrustedNameIsNotTrusted) {
  DevSts::CertificateSpec spec;
  spec.commonName = "signer";
  spec.keyType = KeyType::Rsa2048;
  spec.freshKey = true;
  const DevSts::Credential namesake = DevSts::MakeCertificate(spec);
  ASSERT_EQ(CertificateOf(namesake)->SubjectName(), CertificateOf(Signer())->SubjectName());
  const std::string text = Signed({}, kUnsigned, namesake);
  EXPECT_EQ(Verdict(text, namesake), "valid");
  EXPECT_EQ(Verdict(text, Signer()), NoTrustedKeyFor(namesake));
}

TEST(SignatureKeyTest, MustBeOfTheAlgorithmsType) {
  SignOptions options;
  options.keyInfo = DevSts::KeyInfoContent::None;
  const auto ec = SignerOf(KeyType::EcP256);
  EXPECT_EQ(Verdict(Signed(options), ec), kWrongKeyType);
  options.signature = SignatureAlgorithm::RsaPssSha256;
  EXPECT_EQ(Verdict(Signed(options), ec), kWrongKeyType);
  options.signature = SignatureAlgorithm::EcdsaSha256;
  EXPECT_EQ(Verdict(Signed(options, kUnsigned, ec), Signer()), kWrongKeyType);
  EXPECT_EQ(Verdict(Signed(options, kUnsigned, ec), ec), "valid");
}

TEST(SignatureKeyTest, OfRsaBelow2048BitsIsRefused) {
  const auto weak = SignerOf(KeyType::Rsa1024);
  const std::string text = Signed({}, kUnsigned, weak);
  ASSERT_TRUE(DevSts::VerifyXml(text, weak.certificatePem));
  EXPECT_EQ(Verdict(text, weak),
            "refused: The trusted RSA key has 1024 bits; at least 2048 are needed.");
}

Ref<const KeyInfoResolver> ResolverFor(EVP_PKEY* key) {
  return MakeRef<OneKeyResolver>(MakeCertificate({.key = key})->GetPublicKey());
}

TEST(SignatureKeyTest, OnAnotherCurveIsRefused) {
  SignOptions options;
  options.signature = SignatureAlgorithm::EcdsaSha256;
  const std::string text = Signed(options, kUnsigned, SignerOf(KeyType::EcP256));
  const auto key = MakeEcKey("secp256k1");
  EXPECT_EQ(Verdict(text, ResolverFor(key.get()).get()),
            "refused: The trusted key is not on the curve P-256, P-384 or P-521.");
  const auto sameCurve = MakeEcKey("P-256");
  EXPECT_EQ(Verdict(text, ResolverFor(sameCurve.get()).get()), "invalid");
}

TEST(SignatureKeyTest, OfAnUnknownTypeIsRefused) {
  const auto key = MakeKey("ED25519");
  EXPECT_EQ(Verdict(Signed(), ResolverFor(key.get()).get()), kWrongKeyType);
}

TEST(SignatureKeyTest, OfTheRsaPssTypeVerifiesOnlyPss) {
  const OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA-PSS", nullptr));
  ASSERT_EQ(EVP_PKEY_keygen_init(context.get()), 1);
  EVP_PKEY* made = nullptr;
  ASSERT_EQ(EVP_PKEY_generate(context.get(), &made), 1);
  const OpenSsl::OwnedKey key(made);
  SignOptions options;
  EXPECT_EQ(Verdict(Signed(options), ResolverFor(key.get()).get()), kWrongKeyType);
  options.signature = SignatureAlgorithm::RsaPssSha256;
  EXPECT_EQ(Verdict(Signed(options), ResolverFor(key.get()).get()), "invalid");
}

class ForeignKey final : public Crypto::PublicKey, public ObjectImpl {
 public:
  Crypto::KeyAlgorithm Algorithm() const noexcept override { return Crypto::KeyAlgorithm::kRsa; }
  int Bits() const noexcept override { return 2048; }
};

TEST(SignatureKeyTest, OfAnotherImplementationIsRefused) {
  const auto resolver = MakeRef<OneKeyResolver>(MakeRef<ForeignKey>());
  EXPECT_EQ(Verdict(Signed(), resolver.get()),
            "refused: The trusted key was not made by this library.");
}

TEST(SignatureKeyTest, IsRequired) {
  EXPECT_EQ(Verdict(Signed(), nullptr),
            "refused: A signature cannot be verified without a key resolver.");
  EXPECT_EQ(Verdict(Signed(), MakeRef<OneKeyResolver>(nullptr).get()), NoTrustedKeyFor(Signer()));
}

class ThrowingResolver final : public KeyInfoResolver, public ObjectImpl {
 public:
  Ref<const Crypto::PublicKey> Resolve(const Security::KeyInfo&) const override {
    throw InvalidStateException("no keys today");
  }
};

TEST(SignatureKeyTest, ExceptionsOfTheResolverPropagate) {
  const auto resolver = MakeRef<ThrowingResolver>();
  EXPECT_THROW(Verdict(Signed(), resolver.get()), InvalidStateException);
}

}  // namespace
}  // namespace Tarnik::Testing
