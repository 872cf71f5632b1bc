#include <string>
#include <tuple>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/rsa.h>

#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/crypto/public_key.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "support/algorithm_uris.h"
#include "support/key_texts.h"
#include "support/new_signatures.h"
#include "support/openssl.h"
#include "support/signed_documents.h"
#include "support/test_certificates.h"
#include "support/xml_text.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using Crypto::PrivateKey;

struct MethodCase {
  const char* name;
  const char* algorithm;
  DevSts::KeyType key;
  bool isRandomised;
};

const MethodCase kMethods[] = {
    {"RsaSha256", kRsaSha256, DevSts::KeyType::Rsa2048, false},
    {"RsaSha384", "http://www.w3.org/2001/04/xmldsig-more#rsa-sha384", DevSts::KeyType::Rsa2048,
     false},
    {"RsaSha512", "http://www.w3.org/2001/04/xmldsig-more#rsa-sha512", DevSts::KeyType::Rsa2048,
     false},
    {"RsaPssSha256", "http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1",
     DevSts::KeyType::Rsa2048, true},
    {"RsaPssSha384", "http://www.w3.org/2007/05/xmldsig-more#sha384-rsa-MGF1",
     DevSts::KeyType::Rsa2048, true},
    {"RsaPssSha512", "http://www.w3.org/2007/05/xmldsig-more#sha512-rsa-MGF1",
     DevSts::KeyType::Rsa2048, true},
    {"EcdsaSha256", kEcdsaSha256, DevSts::KeyType::EcP256, true},
    {"EcdsaSha384", "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha384", DevSts::KeyType::EcP384,
     true},
    {"EcdsaSha512", "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512", DevSts::KeyType::EcP256,
     true},
};

struct DigestCase {
  const char* name;
  const char* algorithm;
};
const DigestCase kDigests[] = {
    {"Sha256", kSha256},
    {"Sha384", "http://www.w3.org/2001/04/xmldsig-more#sha384"},
    {"Sha512", "http://www.w3.org/2001/04/xmlenc#sha512"},
};

struct C14nCase {
  const char* name;
  const char* algorithm;
};
const C14nCase kCanonicalizations[] = {
    {"Exclusive", kExclusive},
    {"ExclusiveWithComments", kExclusiveWithComments},
    {"Inclusive", kInclusive},
    {"InclusiveWithComments", kInclusiveWithComments},
};

class NewSignatureAlgorithmsTest
    : public testing::TestWithParam<std::tuple<MethodCase, DigestCase, C14nCase>> {
 protected:
  NewSignatureAlgorithmsTest()
      : signer_(SignerOf(std::get<0>(GetParam()).key)),
        stranger_(SignerOf(std::get<0>(GetParam()).key, "stranger")) {}

  std::string Sign(std::string* value = nullptr) const {
    const auto& [method, digest, c14n] = GetParam();
    Request request(c14n.algorithm, method.algorithm);
    request.Reference("#body", digest.algorithm, c14n.algorithm);
    request.Reference("#time", digest.algorithm, c14n.algorithm);
    request.Place();
    request.signature->Sign(Crypto::CreatePrivateKeyFromPem(signer_.privateKeyPem).get());
    EXPECT_TRUE(request.signature->Verify(Trusting(signer_).get()));
    EXPECT_FALSE(request.signature->Verify(Trusting(stranger_).get()));
    if (value != nullptr) {
      *value = XmlText(FindElement(request.document.get(), "SignatureValue"));
    }
    return request.Text();
  }

  const DevSts::Credential signer_;
  const DevSts::Credential stranger_;
};

TEST_P(NewSignatureAlgorithmsTest, MakeSignaturesThatWeAndTheOracleVerify) {
  const std::string text = Sign();
  EXPECT_EQ(Verdict(text, signer_), "valid");
  const DevSts::VerifyResult verdict = DevSts::VerifyXml(text, signer_.certificatePem);
  EXPECT_TRUE(verdict.valid) << verdict.reason << "\n" << text;
  EXPECT_THAT(verdict.referenceUris, testing::ElementsAre("#body", "#time"));
  EXPECT_FALSE(DevSts::VerifyXml(Replaced(text, ">now<", ">later<"), signer_.certificatePem));
}

TEST_P(NewSignatureAlgorithmsTest, MakeTheSameValueUnlessTheyAreRandomised) {
  std::string first;
  std::string second;
  Sign(&first);
  Sign(&second);
  EXPECT_EQ(first != second, std::get<0>(GetParam()).isRandomised);
}

INSTANTIATE_TEST_SUITE_P(All, NewSignatureAlgorithmsTest,
                         testing::Combine(testing::ValuesIn(kMethods), testing::ValuesIn(kDigests),
                                          testing::ValuesIn(kCanonicalizations)),
                         [](const auto& tested) {
                           return std::string(std::get<0>(tested.param).name) +
                                  std::get<1>(tested.param).name + std::get<2>(tested.param).name;
                         });

OpenSsl::OwnedKey MakePssKey() {
  const OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA-PSS", nullptr));
  EVP_PKEY* key = nullptr;
  EVP_PKEY_keygen_init(context.get());
  EVP_PKEY_CTX_set_rsa_keygen_bits(context.get(), 2048);
  EVP_PKEY_generate(context.get(), &key);
  return OpenSsl::OwnedKey(key);
}

Ref<const PrivateKey> Loaded(const OpenSsl::OwnedKey& key) {
  return Crypto::CreatePrivateKeyFromPem(ToPkcs8Pem(key.get()));
}

std::string SignRefusal(const char* method, const PrivateKey* key) {
  Request request(kExclusive, method);
  request.Reference("#body");
  const std::string blank = XmlText(request.signature->Element());
  const std::string refusal = Refusal([&] { request.signature->Sign(key); });
  if (refusal != "done") {
    EXPECT_EQ(XmlText(request.signature->Element()), blank);
  }
  return refusal;
}

TEST(NewSignatureKeyTest, RefusesKeysThatDoNotFitTheAlgorithm) {
  const char* const pssSha256 = "http://www.w3.org/2007/05/xmldsig-more#sha256-rsa-MGF1";
  const auto ec = Loaded(MakeEcKey("P-256"));
  const auto pss = Loaded(MakePssKey());
  const auto edwards = Loaded(MakeKey("ED25519"));
  EXPECT_EQ(SignRefusal(kRsaSha256, ec.get()),
            std::string("security: The private key is an EC key; the signature algorithm '") +
                kRsaSha256 + "' needs an RSA key.");
  EXPECT_EQ(SignRefusal(kRsaSha256, pss.get()),
            std::string("security: The private key is an RSA-PSS key; the signature algorithm '") +
                kRsaSha256 + "' needs an RSA key.");
  EXPECT_EQ(SignRefusal(pssSha256, ec.get()),
            std::string("security: The private key is an EC key; the signature algorithm '") +
                pssSha256 + "' needs an RSA or RSA-PSS key.");
  EXPECT_EQ(SignRefusal(kEcdsaSha256, SignerKey().get()),
            std::string("security: The private key is an RSA key; the signature algorithm '") +
                kEcdsaSha256 + "' needs an EC key.");
  EXPECT_EQ(SignRefusal(kEcdsaSha256, edwards.get()),
            std::string("security: The private key is neither an RSA nor an EC key; the signature "
                        "algorithm '") +
                kEcdsaSha256 + "' needs an EC key.");
  EXPECT_EQ(SignRefusal(pssSha256, pss.get()), "done");
}

TEST(NewSignatureKeyTest, RefusesWeakKeys) {
  const auto weak = Loaded(MakeRsaKey(1024));
  EXPECT_EQ(SignRefusal(kRsaSha256, weak.get()),
            "security: The private RSA key has 1024 bits; at least 2048 are needed.");
  const auto uncommon = Loaded(MakeEcKey("secp256k1"));
  EXPECT_EQ(SignRefusal(kEcdsaSha256, uncommon.get()),
            "security: The private key is not on the curve P-256, P-384 or P-521.");
}

class StrangeKey final : public PrivateKey, public ObjectImpl {
 public:
  Ref<const Crypto::PublicKey> GetPublicKey() const override { return nullptr; }
  bool Matches(const Crypto::Certificate&) const override { return true; }
};

TEST(NewSignatureKeyTest, RefusesKeysOfOtherImplementations) {
  EXPECT_EQ(SignRefusal(kRsaSha256, MakeRef<StrangeKey>().get()),
            "security: The private key was not made by this library.");
}

TEST(NewSignatureKeyTest, SignsOnP521) {
  const OpenSsl::OwnedKey key = MakeEcKey("P-521");
  CertificateRecipe recipe;
  recipe.key = key.get();
  Request request(kExclusive, "http://www.w3.org/2001/04/xmldsig-more#ecdsa-sha512");
  request.Reference("#body");
  request.signature->Sign(Loaded(key).get());
  EXPECT_EQ(
      StringUtil::Base64Encode(std::vector<unsigned char>(132)).size(),
      Between(XmlText(request.signature->Element()), "<ds:SignatureValue>", "</ds:SignatureValue>")
          .size());
  request.Place();
  EXPECT_TRUE(request.signature->Verify(
      CreateTrustedCertificatesResolver({MakeCertificate(recipe)}).get()));
}

}  // namespace
}  // namespace Tarnik::Testing
