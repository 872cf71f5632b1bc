#include <algorithm>
#include <cstddef>
#include <random>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "crypto/hash.h"
#include "crypto/public_key_impl.h"
#include "support/key_info_texts.h"
#include "support/openssl.h"
#include "support/test_certificates.h"

// The certificates and the keys that a resolver returns for a KeyInfo belong to each other.
namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Xml::Security;
using Crypto::Certificate;
using testing::ElementsAre;
using testing::IsEmpty;

using Trusted = Ref<const Certificate>;
using Key = Ref<const Crypto::PublicKey>;

std::vector<unsigned char> BytesOf(const Trusted& certificate) {
  return {certificate->DerBytes(), certificate->DerBytes() + certificate->DerLength()};
}

bool IsOneKey(const Key& a, const Key& b) {
  return EVP_PKEY_eq(dynamic_cast<const Crypto::PublicKeyImpl&>(*a).Handle(),
                     dynamic_cast<const Crypto::PublicKeyImpl&>(*b).Handle()) == 1;
}

Ref<const CertificateCandidatesResolver> MakeResolver(std::vector<Trusted> certificates) {
  const auto resolver = CreateTrustedCertificatesResolver(std::move(certificates));
  return Ref<const CertificateCandidatesResolver>(
      dynamic_cast<const CertificateCandidatesResolver*>(resolver.get()));
}

/// The keys of the certificates, each once, in their order.
std::vector<Key> DifferentKeysOf(const std::vector<Trusted>& certificates) {
  std::vector<Key> keys;
  for (const Trusted& certificate : certificates) {
    const Key key = certificate->GetPublicKey();
    if (std::none_of(keys.begin(), keys.end(),
                     [&key](const Key& known) { return IsOneKey(known, key); })) {
      keys.push_back(key);
    }
  }
  return keys;
}

bool AreTheSameKeys(const std::vector<Key>& a, const std::vector<Key>& b) {
  return std::equal(a.begin(), a.end(), b.begin(), b.end(), IsOneKey);
}

class CertificateCandidatesTest : public testing::Test {
 protected:
  static Trusted Make(const OpenSsl::OwnedKey& key, const char* name, const char* serial) {
    return MakeCertificate(
        {.key = key.get(), .commonName = name, .serial = serial, .withKeyIdentifier = true});
  }

  KeyInfo RandomKeyInfo();

  const OpenSsl::OwnedKey firstKey_ = MakeEcKey("P-256");
  const OpenSsl::OwnedKey secondKey_ = MakeEcKey("P-256");
  const Trusted first_ = Make(firstKey_, "a", "1");
  const Trusted renewed_ = Make(firstKey_, "a", "2");
  const Trusted second_ = Make(secondKey_, "b", "3");
  const Trusted namesake_ = Make(secondKey_, "a", "4");
  const Trusted rsa_ = MakeCertificate({.commonName = "b", .serial = "5"});
  const Trusted stranger_ = Make(MakeEcKey("P-256"), "c", "6");
  const std::vector<Trusted> list_{first_, second_, renewed_, rsa_, namesake_, first_};
  const Ref<const CertificateCandidatesResolver> resolver_ = MakeResolver(list_);

 private:
  std::size_t Random(std::size_t bound) { return random_() % bound; }

  std::mt19937 random_{20240305};
};

// Hints of every kind, some of which name nothing, and more of them than are used.
KeyInfo CertificateCandidatesTest::RandomKeyInfo() {
  const std::vector<Trusted> named{first_, renewed_, second_, namesake_, rsa_, stranger_};
  std::string keys;
  std::string digests;
  KeyInfo hints;
  const std::size_t kinds = Random(64);
  const std::size_t count = Random(8) == 0 ? 17 + Random(4) : 1 + Random(3);
  for (std::size_t i = 0; i < count; ++i) {
    const Trusted& one = Random(2) == 0 ? stranger_ : named[Random(named.size())];
    if ((kinds & 1) != 0) {
      keys += DerEncodedKey(*one);
    }
    if ((kinds & 2) != 0) {
      digests += DigestOf(*one, kSha384Uri, Crypto::Hash::kSha384);
    }
    if ((kinds & 4) != 0) {
      hints.subjectNames.push_back(one->SubjectName());
    }
    if ((kinds & 8) != 0) {
      hints.subjectKeyIdentifiers.push_back(one->SubjectKeyIdentifier());
    }
    if ((kinds & 48) == 16) {
      hints.issuerSerials.push_back({one->IssuerName(), "0" + one->SerialNumber()});
    }
    if ((kinds & 48) == 32) {
      hints.certificates.push_back(BytesOf(one));
    }
  }
  hints.element = ReadHints("<KeyName>any</KeyName>" + keys + digests).element;
  return hints;
}

TEST_F(CertificateCandidatesTest, HaveTheKeysThatAreCandidates) {
  std::size_t several = 0;
  std::size_t none = 0;
  for (int i = 0; i < 300; ++i) {
    const KeyInfo keyInfo = RandomKeyInfo();
    const auto certificates = resolver_->CandidateCertificates(keyInfo);
    ASSERT_TRUE(AreTheSameKeys(DifferentKeysOf(certificates), resolver_->Candidates(keyInfo))) << i;
    several += certificates.size() > 1 ? 1 : 0;
    none += certificates.empty() ? 1 : 0;
  }
  EXPECT_GT(several, 30U);
  EXPECT_GT(none, 30U);
}

TEST_F(CertificateCandidatesTest, AreAllThatAHintNames) {
  KeyInfo keyInfo;
  EXPECT_EQ(resolver_->CandidateCertificates(keyInfo), list_);
  keyInfo.subjectNames = {"CN=A, O=\"Test, Inc.\""};
  EXPECT_THAT(resolver_->CandidateCertificates(keyInfo),
              ElementsAre(first_, renewed_, namesake_, first_));
  keyInfo.subjectKeyIdentifiers = {second_->SubjectKeyIdentifier()};
  EXPECT_THAT(resolver_->CandidateCertificates(keyInfo), ElementsAre(second_, namesake_));
  keyInfo.issuerSerials = {{renewed_->IssuerName(), "2"}};
  EXPECT_THAT(resolver_->CandidateCertificates(keyInfo), ElementsAre(renewed_));
  keyInfo.certificates = {BytesOf(stranger_), BytesOf(renewed_), BytesOf(first_)};
  EXPECT_THAT(resolver_->CandidateCertificates(keyInfo), ElementsAre(renewed_));
  keyInfo.certificates = {BytesOf(stranger_)};
  EXPECT_THAT(resolver_->CandidateCertificates(keyInfo), IsEmpty());
}

TEST_F(CertificateCandidatesTest, AreNamedByKeysAndDigests) {
  EXPECT_THAT(resolver_->CandidateCertificates(ReadHints(DerEncodedKey(*renewed_))),
              ElementsAre(first_, renewed_, first_));
  EXPECT_THAT(
      resolver_->CandidateCertificates(ReadHints(
          DigestOf(*namesake_, kSha256Uri, Crypto::Hash::kSha256) + DerEncodedKey(*first_))),
      ElementsAre(namesake_));
}

TEST_F(CertificateCandidatesTest, AreNamedByTheFirst16Hints) {
  KeyInfo keyInfo;
  keyInfo.certificates.assign(15, BytesOf(stranger_));
  keyInfo.certificates.push_back(BytesOf(second_));
  EXPECT_THAT(resolver_->CandidateCertificates(keyInfo), ElementsAre(second_));
  keyInfo.certificates.insert(keyInfo.certificates.begin(), BytesOf(stranger_));
  EXPECT_THAT(resolver_->CandidateCertificates(keyInfo), IsEmpty());
}

TEST_F(CertificateCandidatesTest, NeedNoHintIfThereIsOnlyOne) {
  const auto resolver = MakeResolver({second_});
  EXPECT_THAT(resolver->CandidateCertificates(KeyInfo()), ElementsAre(second_));
  EXPECT_THAT(resolver->CandidateCertificates(ReadHints(DerEncodedKey(*first_))),
              ElementsAre(second_));
}

TEST_F(CertificateCandidatesTest, WithAnUnknownKeyAreSkippedOrReported) {
  std::vector<unsigned char> der = MakeCertificateDer({.commonName = "unknown"});
  // The last number of rsaEncryption, 1.2.840.113549.1.1.1, becomes 127.
  const std::vector<unsigned char> identifier{0x2A, 0x86, 0x48, 0x86, 0xF7, 0x0D, 1, 1, 1};
  const auto place = std::search(der.begin(), der.end(), identifier.begin(), identifier.end());
  ASSERT_NE(place, der.end());
  *(place + 8) = 127;
  const Trusted unknown = Crypto::CreateCertificateFromDer(der.data(), der.size());
  const auto resolver = MakeResolver({unknown, first_});
  KeyInfo keyInfo;
  EXPECT_THAT(resolver->CandidateCertificates(keyInfo), ElementsAre(first_));
  keyInfo.certificates = {der};
  EXPECT_THROW(resolver->Candidates(keyInfo), Crypto::CryptoException);
  EXPECT_THROW(resolver->CandidateCertificates(keyInfo), Crypto::CryptoException);
}

}  // namespace
}  // namespace Tarnik::Testing
