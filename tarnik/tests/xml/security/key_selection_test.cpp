#include "xml/security/key_selection.h"

#include <cstddef>
#include <string>
#include <utility>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info_resolver.h>
#include <tarnik/xml/security/xml_security_exception.h>

#include "support/key_info_texts.h"
#include "support/openssl.h"
#include "support/signed_documents.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using Crypto::Certificate;
using DevSts::KeyType;
using DevSts::SignOptions;

using CertificateList = std::vector<Ref<const Certificate>>;

constexpr const char* kNoSigner =
    "refused: There is no trusted key for the signature, which names no signer.";

/// A document that `signer` has signed, with a KeyInfo of this content, or without one.
std::string SignedWith(
    const DevSts::Credential& signer, const std::string& keyInfo = "",
    DevSts::SignatureAlgorithm algorithm = DevSts::SignatureAlgorithm::RsaSha256) {
  SignOptions options;
  options.keyInfo = DevSts::KeyInfoContent::None;
  options.signature = algorithm;
  const std::string text = Signed(options, kUnsigned, signer);
  return keyInfo.empty() ? text
                         : Replaced(text, "</ds:SignatureValue>",
                                    "</ds:SignatureValue>" + KeyInfoText(keyInfo));
}

std::string VerdictOf(const std::string& text, CertificateList trusted) {
  return Verdict(text, CreateTrustedCertificatesResolver(std::move(trusted)).get());
}

std::string Sha256Of(const Certificate& certificate) {
  return DigestOf(certificate, kSha256Uri, Crypto::Hash::kSha256);
}

/// Certificates with different keys on P-256.
CertificateList MakeEcCertificates(std::size_t count) {
  CertificateList certificates;
  for (std::size_t i = 0; i < count; ++i) {
    certificates.push_back(MakeCertificate({.key = MakeEcKey("P-256").get()}));
  }
  return certificates;
}

class KeyRolloverTest : public testing::Test {
 protected:
  const Ref<const Certificate> signer_ = CertificateOf(Signer());
  const Ref<const Certificate> stranger_ = CertificateOf(Stranger());
  const Ref<const Certificate> other_ = MakeCertificate();  // RSA too
  const Ref<const Certificate> ec_ = MakeCertificate({.key = MakeEcKey("P-256").get()});
  const CertificateList trusted_{other_, ec_, signer_};
};

TEST_F(KeyRolloverTest, AcceptsEveryHintAtATrustedKey) {
  for (const std::string& keyInfo :
       {std::string(), std::string("<KeyName>key</KeyName>"), DerEncodedKey(*signer_),
        Sha256Of(*signer_), DigestOf(*signer_, kSha384Uri, Crypto::Hash::kSha384),
        "<KeyName>key</KeyName>" + DerEncodedKey(*stranger_) + DerEncodedKey(*signer_),
        "<X509Data><X509SubjectName>" + signer_->SubjectName() + "</X509SubjectName></X509Data>"}) {
    EXPECT_EQ(VerdictOf(SignedWith(Signer(), keyInfo), trusted_), "valid") << keyInfo;
    const std::string changed =
        Replaced(SignedWith(Signer(), keyInfo), "user@example", "root@example");
    EXPECT_EQ(VerdictOf(changed, trusted_), "invalid") << keyInfo;
    EXPECT_NE(VerdictOf(SignedWith(Stranger(), keyInfo), trusted_), "valid") << keyInfo;
  }
  SignOptions bareKey;
  bareKey.keyInfo = DevSts::KeyInfoContent::KeyValue;
  EXPECT_EQ(VerdictOf(Signed(bareKey), trusted_), "valid");
}

TEST_F(KeyRolloverTest, RefusesAStrangerWhoNamesHisKey) {
  const std::string hash =
      "'" +
      Between(VerdictOf(SignedWith(Stranger(), DerEncodedKey(*stranger_)), trusted_), "hash '",
              "'") +
      "'";
  EXPECT_EQ(hash.size(), 66U);
  EXPECT_EQ(VerdictOf(SignedWith(Stranger(), DerEncodedKey(*stranger_)), trusted_),
            "refused: There is no trusted key for the signature, whose key has the SHA-256 hash " +
                hash + ".");
  SignOptions bareKey;
  bareKey.keyInfo = DevSts::KeyInfoContent::KeyValue;
  EXPECT_EQ(VerdictOf(Signed(bareKey, kUnsigned, Stranger()), trusted_),
            "refused: There is no trusted key for the signature, whose key has the SHA-256 hash " +
                hash + ".");
  EXPECT_EQ(
      VerdictOf(SignedWith(Stranger(), Sha256Of(*stranger_)), trusted_).substr(0, 86),
      "refused: There is no trusted key for the signature, whose certificate has the digest '");
  EXPECT_EQ(VerdictOf(SignedWith(Stranger()), trusted_), kNoSigner);
  EXPECT_EQ(VerdictOf(SignedWith(Stranger(), "<KeyName>signer</KeyName>"), trusted_),
            "refused: There is no trusted key for the signature, whose key is named 'signer'.");
}

TEST_F(KeyRolloverTest, RefusesAStrangerWhoNamesATrustedKey) {
  for (const std::string& keyInfo : {Sha256Of(*signer_), DerEncodedKey(*signer_),
                                     DerEncodedKey(*stranger_) + DerEncodedKey(*signer_),
                                     DerEncodedKey(*signer_) + DerEncodedKey(*stranger_)}) {
    EXPECT_EQ(VerdictOf(SignedWith(Stranger(), keyInfo), trusted_), "invalid") << keyInfo;
    EXPECT_EQ(VerdictOf(SignedWith(Signer(), keyInfo), trusted_), "valid") << keyInfo;
  }
}

// The first kind of hint decides, so a key that contradicts it does not help.
TEST_F(KeyRolloverTest, RefusesContradictingHints) {
  EXPECT_EQ(VerdictOf(SignedWith(Signer(), Sha256Of(*other_) + DerEncodedKey(*signer_)), trusted_),
            "invalid");
  EXPECT_EQ(
      VerdictOf(SignedWith(Signer(), DerEncodedKey(*signer_) + Sha256Of(*stranger_)), trusted_)
          .substr(0, 86),
      "refused: There is no trusted key for the signature, whose certificate has the digest '");
}

TEST_F(KeyRolloverTest, TriesAllKeysThatAHintNames) {
  DevSts::CertificateSpec spec;
  spec.commonName = "sts";
  spec.keyType = KeyType::Rsa2048;
  spec.freshKey = true;
  const auto next = DevSts::MakeCertificate(spec);
  const std::string name = "<X509Data><X509SubjectName>" + CertificateOf(next)->SubjectName() +
                           "</X509SubjectName></X509Data>";
  const auto old = DevSts::MakeCertificate(spec);
  ASSERT_EQ(CertificateOf(old)->SubjectName(), CertificateOf(next)->SubjectName());
  const CertificateList both{CertificateOf(old), CertificateOf(next), signer_};
  EXPECT_EQ(VerdictOf(SignedWith(old, name), both), "valid");
  EXPECT_EQ(VerdictOf(SignedWith(next, name), both), "valid");
  EXPECT_EQ(VerdictOf(SignedWith(Signer(), name), both),
            "refused: There is no trusted key for the signature, whose certificate is of '" +
                CertificateOf(next)->SubjectName() + "'.");
}

TEST_F(KeyRolloverTest, SkipsKeysThatDoNotFit) {
  const auto weak = SignerOf(KeyType::Rsa1024);
  const CertificateList trusted{CertificateOf(weak), ec_, other_, signer_};
  EXPECT_EQ(VerdictOf(SignedWith(Signer()), trusted), "valid");
  EXPECT_EQ(VerdictOf(SignedWith(weak), trusted), kNoSigner);
}

TEST_F(KeyRolloverTest, RefusesWhenNoKeyFits) {
  const auto weak = SignerOf(KeyType::Rsa1024);
  EXPECT_EQ(VerdictOf(SignedWith(weak), {ec_, CertificateOf(weak)}),
            "refused: The trusted RSA key has 1024 bits; at least 2048 are needed.");
  EXPECT_EQ(VerdictOf(SignedWith(weak, DerEncodedKey(*CertificateOf(weak))),
                      {other_, CertificateOf(weak)}),
            "refused: The trusted RSA key has 1024 bits; at least 2048 are needed.");
  EXPECT_EQ(VerdictOf(SignedWith(Signer()), MakeEcCertificates(2)),
            "refused: No trusted key is of the type of the signature algorithm.");
  EXPECT_EQ(VerdictOf(SignedWith(Signer(), DerEncodedKey(*ec_)), trusted_),
            "refused: The trusted key is not of the type of the signature algorithm.");
}

class ManyTrustedKeysTest : public testing::Test {
 protected:
  const DevSts::Credential signer_ = SignerOf(KeyType::EcP256);
  const std::string text_ = SignedWith(signer_, "", DevSts::SignatureAlgorithm::EcdsaSha256);
};

// Otherwise a message without a hint costs as many verifications as there are trusted keys.
TEST_F(ManyTrustedKeysTest, AreNotAllTried) {
  CertificateList trusted = MakeEcCertificates(1000);
  trusted[15] = CertificateOf(signer_);
  EXPECT_EQ(VerdictOf(text_, trusted), "valid");
  std::swap(trusted[15], trusted[16]);
  EXPECT_EQ(VerdictOf(text_, trusted),
            "refused: There is no trusted key for the signature, which names no signer (only the "
            "first 16 keys of its type were tried).");
  std::swap(trusted[16], trusted[999]);
  const auto withHint = [this, &trusted](const std::string& hint) {
    return VerdictOf(
        Replaced(text_, "</ds:SignatureValue>", "</ds:SignatureValue>" + KeyInfoText(hint)),
        trusted);
  };
  EXPECT_EQ(withHint(DerEncodedKey(*trusted[999])), "valid");
  EXPECT_EQ(withHint(Sha256Of(*trusted[999])), "valid");
}

// Neither keys of other types nor further certificates of one key take the place of a key.
TEST_F(ManyTrustedKeysTest, AreCountedWhenTheyAreDifferentAndFit) {
  CertificateList trusted;
  const auto key = MakeEcKey("P-256");
  const auto other = MakeEcKey("secp256k1");
  for (int i = 1; i <= 40; ++i) {
    const std::string serial = std::to_string(i);
    trusted.push_back(MakeCertificate({.key = key.get(), .serial = serial.c_str()}));
    trusted.push_back(MakeCertificate({.serial = serial.c_str()}));
    trusted.push_back(MakeCertificate({.key = other.get(), .serial = serial.c_str()}));
  }
  trusted.push_back(CertificateOf(signer_));
  EXPECT_EQ(VerdictOf(text_, trusted), "valid");
}

class FixedCandidates final : public KeyCandidatesResolver, public ObjectImpl {
 public:
  explicit FixedCandidates(std::vector<Ref<const Crypto::PublicKey>> keys)
      : keys_(std::move(keys)) {}
  Ref<const Crypto::PublicKey> Resolve(const Security::KeyInfo&) const override {
    throw XmlSecurityException("not to be called");
  }
  std::vector<Ref<const Crypto::PublicKey>> Candidates(const Security::KeyInfo&) const override {
    return keys_;
  }

 private:
  std::vector<Ref<const Crypto::PublicKey>> keys_;
};

class ForeignRsaKey final : public Crypto::PublicKey, public ObjectImpl {
 public:
  Crypto::KeyAlgorithm Algorithm() const noexcept override { return Crypto::KeyAlgorithm::kRsa; }
  int Bits() const noexcept override { return 2048; }
};

TEST(KeyCandidatesResolverTest, MayBeImplementedByCallers) {
  const auto verdict = [](std::vector<Ref<const Crypto::PublicKey>> keys) {
    return Verdict(SignedWith(Signer()), MakeRef<FixedCandidates>(std::move(keys)).get());
  };
  const auto signer = CertificateOf(Signer())->GetPublicKey();
  const auto stranger = CertificateOf(Stranger())->GetPublicKey();
  const auto foreign = MakeRef<ForeignRsaKey>();
  EXPECT_EQ(verdict({stranger, signer}), "valid");
  EXPECT_EQ(verdict({signer}), "valid");
  EXPECT_EQ(verdict({nullptr, signer, nullptr}), "valid");
  EXPECT_EQ(verdict({foreign, stranger, signer}), "valid");
  EXPECT_EQ(verdict({stranger}), "invalid");
  EXPECT_EQ(verdict({}), kNoSigner);
  EXPECT_EQ(verdict({nullptr}), kNoSigner);
  EXPECT_EQ(verdict({foreign}), "refused: The trusted key was not made by this library.");
  EXPECT_EQ(verdict({foreign, foreign}),
            "refused: No trusted key is of the type of the signature algorithm.");
}

// A key that the library cannot use with the algorithm does not keep others from being tried.
TEST(KeyCandidatesResolverTest, MayReturnAKeyThatFails) {
  const OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA-PSS", nullptr));
  ASSERT_EQ(EVP_PKEY_keygen_init(context.get()), 1);
  ASSERT_EQ(EVP_PKEY_CTX_set_rsa_pss_keygen_md(context.get(), EVP_sha512()), 1);
  ASSERT_EQ(EVP_PKEY_CTX_set_rsa_pss_keygen_mgf1_md(context.get(), EVP_sha512()), 1);
  EVP_PKEY* made = nullptr;
  ASSERT_EQ(EVP_PKEY_generate(context.get(), &made), 1);
  const OpenSsl::OwnedKey key(made);
  OpenSsl::OwnedKey copy(EVP_PKEY_dup(made));
  const Ref<const Crypto::PublicKey> restricted =
      MakeRef<const Crypto::PublicKeyImpl>(std::move(copy));
  const auto signer = CertificateOf(Signer())->GetPublicKey();
  const auto stranger = CertificateOf(Stranger())->GetPublicKey();
  const auto verdict = [](std::vector<Ref<const Crypto::PublicKey>> keys) {
    return Verdict(SignedWith(Signer(), "", DevSts::SignatureAlgorithm::RsaPssSha256),
                   MakeRef<FixedCandidates>(std::move(keys)).get());
  };
  EXPECT_EQ(verdict({restricted, signer}), "valid");
  EXPECT_EQ(verdict({restricted, stranger}), verdict({restricted}));
  EXPECT_EQ(verdict({restricted}).substr(0, 9), "refused: ");
  // Such a key cannot make a signature of another scheme, so it is not tried.
  EXPECT_EQ(Verdict(SignedWith(Signer()),
                    MakeRef<FixedCandidates>(
                        std::vector<Ref<const Crypto::PublicKey>>{restricted, restricted})
                        .get()),
            "refused: No trusted key is of the type of the signature algorithm.");
}

}  // namespace
}  // namespace Tarnik::Testing
