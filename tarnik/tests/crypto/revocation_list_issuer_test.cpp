#include <algorithm>
#include <cstddef>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/revocation_list.h>

#include "support/openssl.h"
#include "support/test_certificates.h"
#include "support/test_revocation_lists.h"

// Who made a revocation list.
namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;

Ref<const RevocationList> MakeList(const RevocationListRecipe& recipe = {}) {
  const auto der = MakeRevocationListDer(recipe);
  return CreateRevocationListFromDer(der.data(), der.size());
}

/// The certificate of `recipe` with one more extension.
Ref<const Certificate> MakeIssuer(int extension, const char* value,
                                  const CertificateRecipe& recipe = {}) {
  const auto der = MakeCertificateDer(recipe);
  const unsigned char* position = der.data();
  const OpenSsl::OwnedCertificate certificate(
      d2i_X509(nullptr, &position, static_cast<long>(der.size())));
  X509_add_ext(certificate.get(), MakeExtension(extension, value).get(), -1);
  X509_sign(certificate.get(), recipe.key, EVP_sha256());
  unsigned char* bytes = nullptr;
  const int length = i2d_X509(certificate.get(), &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return CreateCertificateFromDer(bytes, static_cast<std::size_t>(length));
}

struct ListAlgorithm {
  const char* name;
  OpenSsl::OwnedKey (*makeKey)();
  const EVP_MD* (*hash)();
  bool isPss;
  bool isAccepted;
};

class ListAlgorithmTest : public testing::TestWithParam<ListAlgorithm> {};

TEST_P(ListAlgorithmTest, DecidesWhetherAListIsAccepted) {
  const OpenSsl::OwnedKey key = GetParam().makeKey();
  const auto list =
      MakeList({.key = key.get(), .hash = GetParam().hash(), .isPss = GetParam().isPss});
  EXPECT_EQ(list->IsFrom(*MakeCertificate({.key = key.get()})), GetParam().isAccepted);
  EXPECT_FALSE(list->IsFrom(*MakeCertificate({.key = MakeEcKey("P-256").get()})));
}

OpenSsl::OwnedKey SharedRsa2048() {
  EVP_PKEY_up_ref(SharedRsaKey());
  return OpenSsl::OwnedKey(SharedRsaKey());
}

OpenSsl::OwnedKey MakeRsa1024() {
  return MakeRsaKey(1024);
}

INSTANTIATE_TEST_SUITE_P(
    Lists, ListAlgorithmTest,
    testing::Values(
        ListAlgorithm{"RsaSha256", SharedRsa2048, EVP_sha256, false, true},
        ListAlgorithm{"RsaSha384", SharedRsa2048, EVP_sha384, false, true},
        ListAlgorithm{"RsaSha512", SharedRsa2048, EVP_sha512, false, true},
        ListAlgorithm{"RsaSha1", SharedRsa2048, EVP_sha1, false, false},
        ListAlgorithm{"RsaSha224", SharedRsa2048, EVP_sha224, false, false},
        ListAlgorithm{"RsaShort", MakeRsa1024, EVP_sha256, false, false},
        ListAlgorithm{"PssSha256", SharedRsa2048, EVP_sha256, true, true},
        ListAlgorithm{"PssSha512", SharedRsa2048, EVP_sha512, true, true},
        ListAlgorithm{"PssSha1", SharedRsa2048, EVP_sha1, true, false},
        ListAlgorithm{"P256", [] { return MakeEcKey("P-256"); }, EVP_sha256, false, true},
        ListAlgorithm{"P384", [] { return MakeEcKey("P-384"); }, EVP_sha384, false, true},
        ListAlgorithm{"P521", [] { return MakeEcKey("P-521"); }, EVP_sha512, false, true},
        ListAlgorithm{"P256Sha1", [] { return MakeEcKey("P-256"); }, EVP_sha1, false, false},
        ListAlgorithm{"Secp256k1", [] { return MakeEcKey("secp256k1"); }, EVP_sha256, false,
                      false}),
    [](const auto& tested) { return tested.param.name; });

TEST(RevocationListIssuerTest, HasTheNameOfTheList) {
  EXPECT_TRUE(MakeList()->IsFrom(*MakeCertificate()));
  EXPECT_TRUE(MakeList()->IsFrom(*MakeCertificate({.issuerCommonName = "root"})));
  EXPECT_FALSE(MakeList()->IsFrom(*MakeCertificate({.commonName = "signer2"})));
  EXPECT_FALSE(MakeList({.issuerCommonName = "signer2"})->IsFrom(*MakeCertificate()));
}

// A stranger's list with the name, and one that the name's owner signed with another key.
TEST(RevocationListIssuerTest, HasTheKeyThatSignedTheList) {
  const OpenSsl::OwnedKey stranger = MakeRsaKey(2048);
  const auto list = MakeList({.key = stranger.get()});
  EXPECT_FALSE(list->IsFrom(*MakeCertificate()));
  EXPECT_TRUE(list->IsFrom(*MakeCertificate({.key = stranger.get()})));
  EXPECT_FALSE(list->IsFrom(*MakeCertificate({.key = MakeEcKey("P-256").get()})));
}

TEST(RevocationListIssuerTest, MayBeAllowedToSignListsOnly) {
  EXPECT_TRUE(MakeList()->IsFrom(*MakeIssuer(NID_key_usage, "critical,cRLSign,keyCertSign")));
  EXPECT_TRUE(MakeList()->IsFrom(*MakeIssuer(NID_key_usage, "cRLSign")));
  EXPECT_FALSE(MakeList()->IsFrom(*MakeIssuer(NID_key_usage, "critical,keyCertSign")));
  EXPECT_FALSE(MakeList()->IsFrom(*MakeIssuer(NID_key_usage, "digitalSignature")));
}

Ref<const RevocationList> MakeListOfKey(const std::vector<unsigned char>& identifier) {
  return MakeList({.edit = [&identifier](X509_CRL* raw) {
    std::string content = "\x30" + std::string(1, static_cast<char>(identifier.size() + 2)) +
                          "\x80" + std::string(1, static_cast<char>(identifier.size()));
    content.append(identifier.begin(), identifier.end());
    X509_CRL_add_ext(raw, MakeRawExtension(false, "2.5.29.35", content).get(), -1);
  }});
}

TEST(RevocationListIssuerTest, HasTheKeyIdentifierOfTheListIfBothHaveOne) {
  const auto with = MakeCertificate({.withKeyIdentifier = true});
  std::vector<unsigned char> identifier = with->SubjectKeyIdentifier();
  EXPECT_TRUE(MakeListOfKey(identifier)->IsFrom(*with));
  identifier.back() ^= 1;
  EXPECT_FALSE(MakeListOfKey(identifier)->IsFrom(*with));
  EXPECT_TRUE(MakeListOfKey(identifier)->IsFrom(*MakeCertificate()));
  EXPECT_TRUE(MakeList()->IsFrom(*with));
}

// No byte of a list can be changed, neither of the signed part nor around it.
TEST(RevocationListIssuerTest, SignedEveryByte) {
  const OpenSsl::OwnedKey key = MakeEcKey("P-256");
  const auto issuer = MakeCertificate({.key = key.get()});
  const auto der = MakeRevocationListDer({.key = key.get(), .entries = {{"7"}, {"4711"}}});
  ASSERT_TRUE(CreateRevocationListFromDer(der.data(), der.size())->IsFrom(*issuer));
  std::size_t decoded = 0;
  for (std::size_t bit = 0; bit < 8 * der.size(); ++bit) {
    auto changed = der;
    changed[bit / 8] ^= static_cast<unsigned char>(1U << (bit % 8));
    try {
      const auto list = CreateRevocationListFromDer(changed.data(), changed.size());
      ++decoded;
      ASSERT_FALSE(list->IsFrom(*issuer)) << bit;
    } catch (const CryptoException&) {
    }
  }
  EXPECT_GT(decoded, 300U);
}

// RFC 5280, section 5.1.1.2: the algorithm that is not signed is the one that is.
TEST(RevocationListIssuerTest, NamedOneAlgorithm) {
  auto der = MakeRevocationListDer();
  // The parameters of the algorithm, followed by the signature.
  const std::vector<unsigned char> end{0x05, 0x00, 0x03, 0x82};
  const auto place = std::search(der.begin(), der.end(), end.begin(), end.end());
  ASSERT_NE(place, der.end());
  const auto issuer = MakeCertificate();
  ASSERT_TRUE(CreateRevocationListFromDer(der.data(), der.size())->IsFrom(*issuer));
  *place = 0x04;
  EXPECT_FALSE(CreateRevocationListFromDer(der.data(), der.size())->IsFrom(*issuer));
}

TEST(RevocationListIssuerTest, CannotBeACertificateWithAnUnknownKey) {
  const OpenSsl::OwnedKey key = MakeKey("ED25519");
  EXPECT_FALSE(MakeList()->IsFrom(*MakeCertificate({.key = key.get()})));
}

}  // namespace
}  // namespace Tarnik::Testing
