#include "xml/security/trusted_certificates.h"

#include <algorithm>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/text/string_util.h>
#include <tarnik/xml/document.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "crypto/hash.h"
#include "crypto/public_key_impl.h"
#include "support/key_info_texts.h"
#include "support/openssl.h"
#include "support/test_certificates.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml;
using namespace Tarnik::Xml::Security;
using Crypto::Certificate;
using testing::ElementsAre;
using testing::IsEmpty;

using Trusted = Ref<const Certificate>;

std::vector<unsigned char> DerOf(const Trusted& certificate) {
  return {certificate->DerBytes(), certificate->DerBytes() + certificate->DerLength()};
}

class TrustedCertificatesTest : public testing::Test {
 protected:
  static Trusted Make(const OpenSsl::OwnedKey& key, const char* serial, bool hasIdentifier = true) {
    return MakeCertificate(
        {.key = key.get(), .serial = serial, .withKeyIdentifier = hasIdentifier});
  }

  const OpenSsl::OwnedKey firstKey_ = MakeEcKey("P-256");
  const OpenSsl::OwnedKey secondKey_ = MakeEcKey("P-256");
  const Trusted first_ = Make(firstKey_, "1");
  const Trusted renewed_ = Make(firstKey_, "2");
  const Trusted second_ = Make(secondKey_, "3");
  const Trusted stranger_ = Make(MakeEcKey("P-256"), "4");
  const TrustedCertificates list_{{first_, renewed_, second_}};
};

TEST_F(TrustedCertificatesTest, OfOneKeyAreOneCandidate) {
  KeyInfo keyInfo;
  keyInfo.subjectKeyIdentifiers = {renewed_->SubjectKeyIdentifier()};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(first_->GetPublicKey()));
  keyInfo.subjectKeyIdentifiers = {second_->SubjectKeyIdentifier()};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(second_->GetPublicKey()));
  keyInfo.subjectKeyIdentifiers = {stranger_->SubjectKeyIdentifier()};
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());
}

TEST_F(TrustedCertificatesTest, HaveAKeyIdentifierWithoutTheExtension) {
  const TrustedCertificates list({Make(firstKey_, "5", false), Make(secondKey_, "6", false)});
  KeyInfo keyInfo;
  keyInfo.subjectKeyIdentifiers = {first_->SubjectKeyIdentifier()};
  const auto keys = list.NamedBy(keyInfo);
  ASSERT_EQ(keys.size(), 1U);
  EXPECT_EQ(
      EVP_PKEY_eq(dynamic_cast<const Crypto::PublicKeyImpl&>(*keys[0]).Handle(), firstKey_.get()),
      1);
  keyInfo.subjectKeyIdentifiers = {{}};
  EXPECT_THAT(list.NamedBy(keyInfo), IsEmpty());
}

TEST_F(TrustedCertificatesTest, OfOneNameAreAllCandidates) {
  KeyInfo keyInfo;
  keyInfo.subjectNames = {"O=\"Test, Inc.\"", "cn=Signer, O=\"Test, Inc.\""};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(first_->GetPublicKey(), second_->GetPublicKey()));
  keyInfo.subjectNames = {"O=\"Test, Inc.\""};
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());
}

// NumericString is not among the types whose values are compared as texts.
TEST_F(TrustedCertificatesTest, AreNamedByTheTextOfTheLibrary) {
  std::vector<unsigned char> der = MakeCertificateDer({.commonName = "4711"});
  const std::string value =
      "\x0C\x04"
      "4711";
  const auto place = std::search(der.begin(), der.end(), value.begin(), value.end());
  ASSERT_NE(place, der.end());
  *place = V_ASN1_NUMERICSTRING;
  const auto numeric = Crypto::CreateCertificateFromDer(der.data(), der.size());
  const TrustedCertificates list({first_, numeric});
  KeyInfo keyInfo;
  for (const char* name : {"CN=4711,O=Test\\, Inc.", "CN=#120434373131,O=Test\\, Inc."}) {
    keyInfo.subjectNames = {name};
    EXPECT_THAT(list.NamedBy(keyInfo), ElementsAre(numeric->GetPublicKey())) << name;
  }
  keyInfo.subjectNames = {"CN=4712,O=Test\\, Inc."};
  EXPECT_THAT(list.NamedBy(keyInfo), IsEmpty());
}

TEST_F(TrustedCertificatesTest, AreNamedByIssuerAndSerialNumber) {
  KeyInfo keyInfo;
  keyInfo.issuerSerials = {{"2.5.4.3=#0c067369676e6572,O=Test\\, Inc.", "03"}};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(second_->GetPublicKey()));
  EXPECT_THAT(list_.NamedByIssuer(keyInfo), ElementsAre(second_->GetPublicKey()));
  keyInfo.issuerSerials = {{"2.5.4.3=#0c067369676e6572,O=Test\\, Inc.", "4"}};
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());
  EXPECT_THAT(list_.NamedByIssuer(keyInfo), IsEmpty());
}

TEST_F(TrustedCertificatesTest, AreNamedByADigest) {
  for (const auto& [algorithm, hash] :
       {std::pair(kSha256Uri, Crypto::Hash::kSha256), std::pair(kSha384Uri, Crypto::Hash::kSha384),
        std::pair(kSha512Uri, Crypto::Hash::kSha512)}) {
    for (int i = 0; i < 2; ++i) {
      EXPECT_THAT(list_.NamedBy(ReadHints(DigestOf(*second_, algorithm, hash))),
                  ElementsAre(second_->GetPublicKey()));
      EXPECT_THAT(list_.NamedBy(ReadHints(DigestOf(*stranger_, algorithm, hash))), IsEmpty());
    }
  }
  EXPECT_THAT(list_.NamedBy(ReadHints(DigestOf(*first_, kSha256Uri, Crypto::Hash::kSha512))),
              IsEmpty());
  EXPECT_THAT(list_.NamedBy(ReadHints(DigestText(kSha256Uri, "*"))), IsEmpty());
}

TEST_F(TrustedCertificatesTest, AreNamedByAKey) {
  EXPECT_THAT(list_.NamedBy(ReadHints(DerEncodedKey(*second_))),
              ElementsAre(second_->GetPublicKey()));
  EXPECT_THAT(list_.NamedBy(ReadHints(DerEncodedKey(*renewed_))),
              ElementsAre(first_->GetPublicKey()));
  EXPECT_THAT(list_.NamedBy(ReadHints(DerEncodedKey(*stranger_))), IsEmpty());
  EXPECT_THAT(list_.NamedBy(ReadHints(DerEncodedKey(*stranger_) + DerEncodedKey(*second_))),
              ElementsAre(second_->GetPublicKey()));
  EXPECT_THAT(list_.NamedBy(ReadHints("<d:DEREncodedKeyValue>*</d:DEREncodedKeyValue>")),
              IsEmpty());
}

TEST_F(TrustedCertificatesTest, AreAllCandidatesWithoutAHint) {
  const auto all = ElementsAre(first_->GetPublicKey(), second_->GetPublicKey());
  EXPECT_THAT(list_.NamedBy(KeyInfo()), all);
  EXPECT_THAT(list_.NamedBy(ReadHints("<KeyName>second</KeyName>")), all);
  EXPECT_THAT(list_.NamedBy(ReadHints("<KeyValue><DSAKeyValue/></KeyValue>")), all);
  EXPECT_THAT(list_.NamedBy(ReadHints(DigestText("urn:other", "AAAA"))), all);
  EXPECT_THAT(list_.NamedByIssuer(KeyInfo()), IsEmpty());
}

// Only the first kind of hint that is present counts, whatever the others name.
TEST_F(TrustedCertificatesTest, AreNamedByTheFirstKindOfHint) {
  const auto digest = [](const Trusted& certificate) {
    return DigestOf(*certificate, kSha256Uri, Crypto::Hash::kSha256);
  };
  KeyInfo keyInfo = ReadHints(digest(second_) + DerEncodedKey(*first_));
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(second_->GetPublicKey()));
  EXPECT_THAT(list_.NamedBy(ReadHints(digest(stranger_) + DerEncodedKey(*first_))), IsEmpty());

  keyInfo.subjectNames = {"CN=stranger"};
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());
  keyInfo.subjectKeyIdentifiers = {first_->SubjectKeyIdentifier()};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(first_->GetPublicKey()));
  keyInfo.issuerSerials = {{second_->IssuerName(), "4"}};
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());
  keyInfo.certificates = {DerOf(second_)};
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(second_->GetPublicKey()));
  keyInfo.certificates = {DerOf(stranger_)};
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());
}

TEST_F(TrustedCertificatesTest, NeedNoHintIfThereIsOnlyOne) {
  const TrustedCertificates list({first_});
  for (const std::string& hint : {std::string("<KeyName>x</KeyName>"), DerEncodedKey(*stranger_),
                                  DigestOf(*stranger_, kSha256Uri, Crypto::Hash::kSha256)}) {
    EXPECT_THAT(list.NamedBy(ReadHints(hint)), ElementsAre(first_->GetPublicKey())) << hint;
  }
  EXPECT_THAT(list.NamedBy(KeyInfo()), ElementsAre(first_->GetPublicKey()));
}

TEST_F(TrustedCertificatesTest, AreNamedByTheFirst16HintsOfEachKind) {
  const std::vector<unsigned char> other = DerOf(stranger_);
  KeyInfo keyInfo;
  keyInfo.certificates.assign(15, other);
  keyInfo.certificates.push_back(DerOf(first_));
  EXPECT_THAT(list_.NamedBy(keyInfo), ElementsAre(first_->GetPublicKey()));
  keyInfo.certificates.insert(keyInfo.certificates.begin(), other);
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());

  std::string keys;
  for (int i = 0; i < 15; ++i) {
    keys += DerEncodedKey(*stranger_);
  }
  EXPECT_THAT(list_.NamedBy(ReadHints(keys + DerEncodedKey(*first_))),
              ElementsAre(first_->GetPublicKey()));
  keys += DerEncodedKey(*stranger_);
  EXPECT_THAT(list_.NamedBy(ReadHints(keys + DerEncodedKey(*first_))), IsEmpty());

  keyInfo = KeyInfo();
  keyInfo.subjectNames.assign(15, "CN=x");
  keyInfo.subjectNames.push_back(second_->SubjectName());
  EXPECT_EQ(list_.NamedBy(keyInfo).size(), 2U);
  keyInfo.subjectNames.insert(keyInfo.subjectNames.begin(), "CN=x");
  EXPECT_THAT(list_.NamedBy(keyInfo), IsEmpty());
}

// RSAKeyValue names an RSA-PSS key too, and a point may be in either form.
TEST_F(TrustedCertificatesTest, AreNamedByAKeyInAnotherForm) {
  const auto compressed = MakeEcKey("P-256");
  const auto point = UncompressedPointOf(compressed.get());
  Require(EVP_PKEY_set_utf8_string_param(compressed.get(), "point-format", "compressed") == 1,
          "point format");
  const Trusted certificate = Make(compressed, "7");
  const TrustedCertificates list({first_, certificate});
  EXPECT_THAT(list.NamedBy(ReadHints(EcKeyValue("urn:oid:1.2.840.10045.3.1.7", point))),
              ElementsAre(certificate->GetPublicKey()));
  EXPECT_THAT(list.NamedBy(ReadHints(DerEncodedKey(*certificate))),
              ElementsAre(certificate->GetPublicKey()));
}

// A certificate of the key that `SharedRsaKey` has, but for PSS only.
Trusted MakePssCertificate() {
  OSSL_PARAM* numbers = nullptr;
  Require(EVP_PKEY_todata(SharedRsaKey(), EVP_PKEY_PUBLIC_KEY, &numbers) == 1, "numbers");
  const OpenSsl::Owned<OSSL_PARAM, OSSL_PARAM_free> owner(numbers);
  const OpenSsl::OwnedKeyContext context(EVP_PKEY_CTX_new_from_name(nullptr, "RSA-PSS", nullptr));
  EVP_PKEY* made = nullptr;
  Require(EVP_PKEY_fromdata_init(context.get()) == 1 &&
              EVP_PKEY_fromdata(context.get(), &made, EVP_PKEY_PUBLIC_KEY, numbers) == 1,
          "PSS key");
  const OpenSsl::OwnedKey key(made);
  const auto other = MakeCertificateDer({.commonName = "pss", .serial = "8"});
  const unsigned char* position = other.data();
  const OpenSsl::OwnedCertificate certificate(
      d2i_X509(nullptr, &position, static_cast<long>(other.size())));
  Require(X509_set_pubkey(certificate.get(), made) == 1 &&
              X509_sign(certificate.get(), SharedRsaKey(), EVP_sha256()) > 0,
          "PSS certificate");
  unsigned char* bytes = nullptr;
  const int length = i2d_X509(certificate.get(), &bytes);
  const OpenSsl::OwnedMemory<unsigned char> der(bytes);
  return Crypto::CreateCertificateFromDer(bytes, static_cast<std::size_t>(length));
}

// Otherwise the order of the list would decide which signatures are accepted, and a certificate
// that is not named could replace one that is.
TEST_F(TrustedCertificatesTest, OfAKeyForPssOnlyHaveAnotherKey) {
  const Trusted pss = MakePssCertificate();
  const Trusted rsa = MakeCertificate({.serial = "9"});
  ASSERT_EQ(pss->GetPublicKey()->Algorithm(), Crypto::KeyAlgorithm::kRsaPss);
  const auto all = TrustedCertificates({pss, first_, rsa}).NamedBy(KeyInfo());
  EXPECT_THAT(all, ElementsAre(pss->GetPublicKey(), first_->GetPublicKey(), rsa->GetPublicKey()));
  KeyInfo keyInfo;
  keyInfo.subjectNames = {pss->SubjectName(), first_->SubjectName()};
  EXPECT_THAT(TrustedCertificates({rsa, pss, first_, second_}).NamedBy(keyInfo),
              testing::Contains(pss->GetPublicKey()));
}

// A certificate whose key the library does not know.
class UnknownKeyTest : public TrustedCertificatesTest {
 protected:
  static Trusted WithUnknownKey() {
    std::vector<unsigned char> der = MakeCertificateDer({.commonName = "unknown"});
    // The last number of rsaEncryption, 1.2.840.113549.1.1.1, becomes 127.
    const std::string identifier = "\x2A\x86\x48\x86\xF7\x0D\x01\x01\x01";
    const auto place =
        std::search(der.begin(), der.end(), identifier.begin(), identifier.end(),
                    [](unsigned char a, char b) { return a == static_cast<unsigned char>(b); });
    Require(place != der.end(), "key type");
    *(place + 8) = 127;
    return Crypto::CreateCertificateFromDer(der.data(), der.size());
  }
};

TEST_F(UnknownKeyTest, IsSkippedAmongOthersAndReportedWhenItIsNamed) {
  const Trusted unknown = WithUnknownKey();
  ASSERT_THROW(unknown->GetPublicKey(), Crypto::CryptoException);
  const TrustedCertificates list({unknown, first_});
  EXPECT_THAT(list.NamedBy(KeyInfo()), ElementsAre(first_->GetPublicKey()));
  KeyInfo keyInfo;
  keyInfo.certificates = {DerOf(unknown)};
  EXPECT_THROW(list.NamedBy(keyInfo), Crypto::CryptoException);
  EXPECT_THROW(TrustedCertificates({unknown}).NamedBy(KeyInfo()), Crypto::CryptoException);
}

// The identity of the unknown key is empty, and so is a hint that cannot be read.
TEST_F(UnknownKeyTest, IsNotNamedByAKeyThatCannotBeRead) {
  const Trusted unknown = WithUnknownKey();
  const TrustedCertificates list({unknown, first_});
  for (const std::string& hint : {std::string("<d:DEREncodedKeyValue>*</d:DEREncodedKeyValue>"),
                                  std::string("<d:DEREncodedKeyValue/>"), RsaKeyValue("*", "AQAB"),
                                  EcKeyValue("urn:oid:1.2.3", "AAAA")}) {
    EXPECT_THAT(list.NamedBy(ReadHints(hint)), IsEmpty()) << hint;
    EXPECT_THAT(list.NamedBy(ReadHints(hint + DerEncodedKey(*first_))),
                ElementsAre(first_->GetPublicKey()))
        << hint;
  }
  EXPECT_THROW(list.NamedBy(ReadHints(DerEncodedKey(*unknown))), Crypto::CryptoException);
}

// While it exists, OpenSSL does not provide SHA-1, nor any other algorithm.
class NoAlgorithms {
 public:
  NoAlgorithms() { Set("no=such"); }
  ~NoAlgorithms() { Set(""); }
  NoAlgorithms(const NoAlgorithms&) = delete;
  NoAlgorithms& operator=(const NoAlgorithms&) = delete;

 private:
  static void Set(const char* properties) {
    EXPECT_EQ(EVP_set_default_properties(nullptr, properties), 1);
  }
};

TEST_F(TrustedCertificatesTest, WithoutAKeyIdentifierAreNotNamedByAnEmptyOne) {
  const auto der = MakeCertificateDer({.key = secondKey_.get(), .serial = "8"});
  Trusted withoutIdentifier;
  {
    const NoAlgorithms scope;
    withoutIdentifier = Crypto::CreateCertificateFromDer(der.data(), der.size());
  }
  const auto& decoded = dynamic_cast<const Crypto::CertificateImpl&>(*withoutIdentifier);
  ASSERT_THAT(decoded.KeyIdentifier(), IsEmpty());
  const TrustedCertificates list({withoutIdentifier, first_});
  KeyInfo keyInfo;
  keyInfo.subjectKeyIdentifiers = {{}};
  EXPECT_THAT(list.NamedBy(keyInfo), IsEmpty());
  keyInfo.subjectKeyIdentifiers.push_back(first_->SubjectKeyIdentifier());
  EXPECT_THAT(list.NamedBy(keyInfo), ElementsAre(first_->GetPublicKey()));
}

}  // namespace
}  // namespace Tarnik::Testing
