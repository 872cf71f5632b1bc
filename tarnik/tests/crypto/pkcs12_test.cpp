#include <cstddef>
#include <stdexcept>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/private_key.h>

#include "support/openssl.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"
#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;

constexpr const char* kSecret = "correct horse";

struct Pki {
  Identity root = MakeCa("Root");
  Identity intermediate = MakeCa("Intermediate", &root);
  Identity leaf = MakeIdentity({}, &intermediate);
  Identity stranger = MakeIdentity({}, &root);

  static const Pki& Get() {
    static const Pki* const pki = new Pki();
    return *pki;
  }
};

struct Recipe {
  const char* passphrase = kSecret;
  EVP_PKEY* key = Pki::Get().leaf.key.get();
  X509* certificate = Pki::Get().leaf.certificate.get();
  std::vector<const Identity*> others = {};
};

OpenSsl::OwnedPkcs12 Make(const Recipe& recipe) {
  STACK_OF(X509)* others = sk_X509_new_null();
  for (const Identity* other : recipe.others) {
    sk_X509_push(others, other->certificate.get());
  }
  OpenSsl::OwnedPkcs12 made(PKCS12_create(recipe.passphrase, nullptr, recipe.key,
                                          recipe.certificate, others, 0, 0, 100, 100, 0));
  sk_X509_free(others);
  if (made == nullptr) {
    throw std::runtime_error("test set-up failed: PKCS#12");
  }
  return made;
}

std::string Encode(PKCS12* pkcs12) {
  unsigned char* bytes = nullptr;
  const int length = i2d_PKCS12(pkcs12, &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  return {reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(length)};
}

KeyAndCertificate Load(const std::string& bytes, const PassphraseCallback& passphrase = {}) {
  return CreateKeyAndCertificateFromPkcs12(reinterpret_cast<const unsigned char*>(bytes.data()),
                                           bytes.size(), passphrase);
}

std::string LoadError(const std::string& bytes, const char* passphrase = kSecret) {
  PassphraseCallback callback;
  if (passphrase != nullptr) {
    callback = [passphrase] { return std::string(passphrase); };
  }
  return ThrownMessage<CryptoException>([&] { Load(bytes, callback); }, "loaded");
}

std::string Der(unsigned char tag, const std::string& content) {
  const std::size_t length = content.size();
  std::string header(1, static_cast<char>(tag));
  for (const unsigned value :
       {0x82U, static_cast<unsigned>(length >> 8), static_cast<unsigned>(length & 0xFF)}) {
    header.push_back(static_cast<char>(value));
  }
  return header + content;
}

/// A bag that contains `bags`, of which it takes ownership (RFC 7292, section 4.2.6). OpenSSL reads
/// such bags, but cannot create them.
PKCS12_SAFEBAG* BagOf(STACK_OF(PKCS12_SAFEBAG) * bags) {
  unsigned char* bytes = nullptr;
  const int length =
      ASN1_item_i2d(reinterpret_cast<ASN1_VALUE*>(bags), &bytes, ASN1_ITEM_rptr(PKCS12_SAFEBAGS));
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  sk_PKCS12_SAFEBAG_pop_free(bags, PKCS12_SAFEBAG_free);
  const std::string kind("\x06\x0b\x2a\x86\x48\x86\xf7\x0d\x01\x0c\x0a\x01\x06");
  const std::string held(reinterpret_cast<const char*>(bytes), static_cast<std::size_t>(length));
  const std::string bag = Der(0x30, kind + Der(0xA0, held));
  const auto* position = reinterpret_cast<const unsigned char*>(bag.data());
  PKCS12_SAFEBAG* made = d2i_PKCS12_SAFEBAG(nullptr, &position, static_cast<long>(bag.size()));
  if (made == nullptr) {
    throw std::runtime_error("test set-up failed: a bag of bags");
  }
  return made;
}

STACK_OF(PKCS12_SAFEBAG) * BagsWith(const Identity& identity) {
  STACK_OF(PKCS12_SAFEBAG)* bags = nullptr;
  PKCS12_add_key(&bags, identity.key.get(), 0, 100, -1, kSecret);
  return bags;
}

/// A PKCS#12 of `bags`, of which it takes ownership, without encryption.
std::string Pack(STACK_OF(PKCS12_SAFEBAG) * bags) {
  STACK_OF(PKCS7)* safes = nullptr;
  PKCS12_add_safe(&safes, bags, -1, 0, nullptr);
  sk_PKCS12_SAFEBAG_pop_free(bags, PKCS12_SAFEBAG_free);
  const OpenSsl::OwnedPkcs12 pkcs12(PKCS12_add_safes(safes, 0));
  sk_PKCS7_pop_free(safes, PKCS7_free);
  PKCS12_set_mac(pkcs12.get(), kSecret, -1, nullptr, 0, 100, EVP_sha256());
  return Encode(pkcs12.get());
}

TEST(Pkcs12Test, ReturnsTheKeyItsCertificateAndTheChain) {
  Recipe recipe;
  recipe.others = {&Pki::Get().intermediate, &Pki::Get().root};
  int asked = 0;
  const KeyAndCertificate loaded = Load(Encode(Make(recipe).get()), [&asked] {
    ++asked;
    return std::string(kSecret);
  });
  EXPECT_EQ(asked, 1);
  EXPECT_EQ(loaded.certificate, Pki::Get().leaf.ToCertificate());
  EXPECT_TRUE(loaded.privateKey->Matches(*loaded.certificate));
  ASSERT_EQ(loaded.chain.size(), 2U);
  EXPECT_EQ(loaded.chain[0], Pki::Get().intermediate.ToCertificate());
  EXPECT_EQ(loaded.chain[1], Pki::Get().root.ToCertificate());
}

TEST(Pkcs12Test, IsLoadedWithoutAskingWhenThePassphraseIsEmpty) {
  for (const char* passphrase : {static_cast<const char*>(nullptr), ""}) {
    Recipe recipe;
    recipe.passphrase = passphrase;
    const KeyAndCertificate loaded =
        Load(Encode(Make(recipe).get()), []() -> std::string { throw std::logic_error("asked"); });
    EXPECT_TRUE(loaded.privateKey->Matches(*loaded.certificate));
    EXPECT_TRUE(loaded.chain.empty());
  }
}

TEST(Pkcs12Test, RefusesAWrongOrMissingPassphrase) {
  const std::string bytes = Encode(Make({}).get());
  EXPECT_EQ(LoadError(bytes, nullptr), "The private key needs a passphrase, and none was given.");
  EXPECT_EQ(LoadError(bytes, "battery staple"),
            "The passphrase of the PKCS#12 is wrong, or the PKCS#12 is broken.");
  EXPECT_THROW(Load(bytes, []() -> std::string { throw std::out_of_range("no vault"); }),
               std::out_of_range);
}

TEST(Pkcs12Test, RefusesAPassphraseWithANul) {
  EXPECT_EQ(ThrownMessage<CryptoException>(
                [] { Load(Encode(Make({}).get()), [] { return std::string(kSecret) + '\0'; }); }),
            "The passphrase of a PKCS#12 cannot hold a NUL.");
}

TEST(Pkcs12Test, RefusesAMissingKeyOrCertificate) {
  Recipe keyless;
  keyless.key = nullptr;
  EXPECT_EQ(LoadError(Encode(Make(keyless).get())), "The PKCS#12 holds no private key.");
  Recipe bare;
  bare.certificate = nullptr;
  EXPECT_EQ(LoadError(Encode(Make(bare).get())), "The PKCS#12 holds no certificate.");
  Recipe mismatched;
  mismatched.certificate = nullptr;
  mismatched.others = {&Pki::Get().stranger};
  EXPECT_EQ(LoadError(Encode(Make(mismatched).get())),
            "No certificate of the PKCS#12 belongs to its private key.");
}

TEST(Pkcs12Test, RefusesASecondKey) {
  STACK_OF(PKCS12_SAFEBAG)* bags = BagsWith(Pki::Get().leaf);
  PKCS12_add_key(&bags, Pki::Get().stranger.key.get(), 0, 100, -1, kSecret);
  EXPECT_EQ(LoadError(Pack(bags)), "The PKCS#12 holds more than one private key.");
}

TEST(Pkcs12Test, RefusesASecondKeyInABagOfBags) {
  STACK_OF(PKCS12_SAFEBAG)* bags = BagsWith(Pki::Get().leaf);
  PKCS12_add_cert(&bags, Pki::Get().leaf.certificate.get());
  STACK_OF(PKCS12_SAFEBAG)* inner = sk_PKCS12_SAFEBAG_new_null();
  sk_PKCS12_SAFEBAG_push(inner, BagOf(BagsWith(Pki::Get().stranger)));
  sk_PKCS12_SAFEBAG_push(bags, BagOf(inner));
  EXPECT_EQ(LoadError(Pack(bags)), "The PKCS#12 holds more than one private key.");
}

// The counterpart of the test above.
TEST(Pkcs12Test, FindsItsOnlyKeyInABagOfBags) {
  STACK_OF(PKCS12_SAFEBAG)* bags = nullptr;
  PKCS12_add_cert(&bags, Pki::Get().leaf.certificate.get());
  sk_PKCS12_SAFEBAG_push(bags, BagOf(BagsWith(Pki::Get().leaf)));
  const KeyAndCertificate loaded = Load(Pack(bags), [] { return std::string(kSecret); });
  EXPECT_TRUE(loaded.privateKey->Matches(*loaded.certificate));
}

TEST(Pkcs12Test, RefusesOneWithoutIntegrityProtection) {
  Recipe recipe;
  STACK_OF(X509)* none = nullptr;
  const OpenSsl::OwnedPkcs12 made(PKCS12_create(recipe.passphrase, nullptr, recipe.key,
                                                recipe.certificate, none, 0, 0, 100, -1, 0));
  EXPECT_EQ(LoadError(Encode(made.get())),
            "The PKCS#12 is not protected against changes by a passphrase.");
}

TEST(Pkcs12Test, RefusesBytesThatAreNotPkcs12) {
  for (const std::string& bytes :
       {std::string(), std::string("text"), std::string("\x30\x00", 2)}) {
    EXPECT_EQ(LoadError(bytes).find("The PKCS#12 cannot be decoded"), 0U);
  }
  EXPECT_THROW(CreateKeyAndCertificateFromPkcs12(nullptr, 0), CryptoException);
}

TEST(Pkcs12Test, RefusesEveryPrefixOfItself) {
  const std::string bytes = Encode(Make({}).get());
  for (std::size_t length = 0; length < bytes.size(); length += 13) {
    EXPECT_NE(LoadError(bytes.substr(0, length)), "loaded") << length;
  }
}

TEST(Pkcs12Test, IsLoadedFromAFile) {
  const TemporaryFile file(Encode(Make({}).get()));
  const KeyAndCertificate loaded =
      LoadKeyAndCertificate(file.Path(), [] { return std::string(kSecret); });
  EXPECT_EQ(loaded.certificate, Pki::Get().leaf.ToCertificate());
}

TEST(Pkcs12Test, NamesTheFileThatCannotBeRead) {
  EXPECT_EQ(ThrownMessage<IOException>([] { LoadKeyAndCertificate("/nonexistent/key.p12"); }),
            "The PKCS#12 file '/nonexistent/key.p12' cannot be read: No such file or directory.");
}

TEST(Pkcs12Test, NamesTheFileThatCannotBeUsed) {
  const TemporaryFile file("nothing here");
  const std::string message = ThrownMessage<CryptoException>(
      [&file] { LoadKeyAndCertificate(file.Path(), [] { return std::string(kSecret); }); });
  EXPECT_EQ(message.rfind("The PKCS#12 file '" + file.Path() + "' cannot be used: ", 0), 0U)
      << message;
}

}  // namespace
}  // namespace Tarnik::Testing
