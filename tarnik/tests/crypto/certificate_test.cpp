#include <atomic>
#include <cstddef>
#include <string>
#include <thread>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/err.h>
#include <openssl/pem.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/crypto/crypto_exception.h>
#include <tarnik/crypto/digest.h>

#include "crypto/certificate_impl.h"
#include "support/openssl.h"
#include "support/temporary_file.h"
#include "support/test_certificates.h"
#include "support/thrown_message.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Crypto;
using testing::HasSubstr;
using testing::IsEmpty;
using testing::StartsWith;

std::string ToPem(const std::vector<unsigned char>& der, const char* label = "CERTIFICATE") {
  const OpenSsl::OwnedBio memory(BIO_new(BIO_s_mem()));
  PEM_write_bio(memory.get(), label, "", der.data(), static_cast<long>(der.size()));
  char* text = nullptr;
  const long length = BIO_get_mem_data(memory.get(), &text);
  return {text, static_cast<std::size_t>(length)};
}

std::string DecodeError(const std::vector<unsigned char>& der) {
  return ThrownMessage<CryptoException>(
      [&der] { CreateCertificateFromDer(der.data(), der.size()); }, "accepted");
}

std::string PemError(const std::string& pem) {
  return ThrownMessage<CryptoException>([&pem] { CreateCertificatesFromPem(pem); }, "accepted");
}

TEST(CertificateTest, ReturnsItsFields) {
  const auto certificate = MakeCertificate({.commonName = "J\xC3\xBCrgen",
                                            .issuerCommonName = "issuer",
                                            .serial = "340282366920938463463374607431768211455"});
  EXPECT_EQ(certificate->SubjectName(), "CN=J\xC3\xBCrgen,O=Test\\, Inc.");
  EXPECT_EQ(certificate->IssuerName(), "CN=issuer,O=Test\\, Inc.");
  EXPECT_EQ(certificate->SerialNumber(), "340282366920938463463374607431768211455");
  EXPECT_EQ(certificate->NotBefore().ToString(), "2024-03-05T07:08:09.000Z");
  EXPECT_EQ(certificate->NotAfter().ToString(), "2099-03-05T07:08:09.000Z");
  EXPECT_EQ(certificate->ToString(), "Certificate of CN=J\xC3\xBCrgen,O=Test\\, Inc.");
}

// 2^511 and 2^512: without the limit, a number of a megabyte would take a minute.
TEST(CertificateTest, HasASerialNumberOfLimitedLength) {
  const OpenSsl::OwnedBigNumber number(BN_new());
  ASSERT_EQ(BN_set_bit(number.get(), 511), 1);
  const OpenSsl::OwnedMemory<char> longest(BN_bn2dec(number.get()));
  EXPECT_EQ(MakeCertificate({.serial = longest.get()})->SerialNumber(), longest.get());
  ASSERT_EQ(BN_set_bit(number.get(), 512), 1);
  const OpenSsl::OwnedMemory<char> longer(BN_bn2dec(number.get()));
  EXPECT_EQ(DecodeError(MakeCertificateDer({.serial = longer.get()})),
            "The certificate's serial number has more than 64 bytes.");
}

TEST(CertificateTest, EscapesControlCharactersInNames) {
  const auto certificate = MakeCertificate({.commonName = std::string("a\0b", 3)});
  EXPECT_EQ(certificate->SubjectName(), "CN=a\\00b,O=Test\\, Inc.");
}

TEST(CertificateTest, ReturnsTimesBefore1970AndAtTheEndOfTheCalendar) {
  const auto certificate =
      MakeCertificate({.notBefore = "19500101000000Z", .notAfter = "99991231235959Z"});
  EXPECT_EQ(certificate->NotBefore().ToString(), "1950-01-01T00:00:00.000Z");
  EXPECT_EQ(certificate->NotAfter().ToString(), "9999-12-31T23:59:59.000Z");
}

TEST(CertificateTest, ReturnsItsBytesUnchanged) {
  const auto der = MakeCertificateDer();
  const auto certificate = CreateCertificateFromDer(der.data(), der.size());
  EXPECT_EQ(std::vector<unsigned char>(certificate->DerBytes(),
                                       certificate->DerBytes() + certificate->DerLength()),
            der);
}

TEST(CertificateTest, ReturnsTheSubjectKeyIdentifier) {
  EXPECT_EQ(MakeCertificate({.withKeyIdentifier = true})->SubjectKeyIdentifier().size(), 20U);
  EXPECT_THAT(MakeCertificate()->SubjectKeyIdentifier(), IsEmpty());
}

TEST(CertificateTest, ReturnsItsPublicKeyAsItIsEncoded) {
  const auto key = MakeEcKey("P-256");
  unsigned char* bytes = nullptr;
  const int length = i2d_PUBKEY(key.get(), &bytes);
  const OpenSsl::OwnedMemory<unsigned char> owner(bytes);
  const auto certificate = MakeCertificate({.key = key.get()});
  EXPECT_EQ(dynamic_cast<const CertificateImpl&>(*certificate).SubjectPublicKeyInfo(),
            std::vector<unsigned char>(bytes, bytes + length));
}

// RFC 5280, section 4.2.1.2, method 1, which OpenSSL uses for the extension too.
TEST(CertificateTest, HasTheUsualKeyIdentifierWithoutTheExtension) {
  const auto with = MakeCertificate({.withKeyIdentifier = true});
  const auto without = MakeCertificate();
  const auto identifierOf = [](const Certificate& certificate) {
    return dynamic_cast<const CertificateImpl&>(certificate).KeyIdentifier();
  };
  EXPECT_EQ(identifierOf(*with), with->SubjectKeyIdentifier());
  EXPECT_EQ(identifierOf(*without), with->SubjectKeyIdentifier());
  EXPECT_NE(identifierOf(*MakeCertificate({.key = MakeEcKey("P-256").get()})),
            with->SubjectKeyIdentifier());
}

TEST(CertificateTest, IsNotDecodedAgainWhenItsBytesAreKnown) {
  const auto der = MakeCertificateDer({.commonName = "decoded once"});
  const auto copy = der;
  const auto first = CreateCertificateFromDer(der.data(), der.size());
  EXPECT_EQ(first, CreateCertificateFromDer(copy.data(), copy.size()));
}

TEST(CertificateTest, DiffersFromOneWithOtherBytes) {
  EXPECT_NE(MakeCertificate({.commonName = "one"}), MakeCertificate({.commonName = "two"}));
}

TEST(CertificateTest, RefusesEveryProperPrefix) {
  auto der = MakeCertificateDer();
  while (!der.empty()) {
    der.pop_back();
    ASSERT_NE(DecodeError(der), "accepted") << der.size();
  }
  EXPECT_EQ(DecodeError({}), "A certificate cannot be empty.");
}

TEST(CertificateTest, RefusesTrailingBytes) {
  auto der = MakeCertificateDer();
  ASSERT_EQ(DecodeError(der), "accepted");
  der.push_back(0);
  EXPECT_EQ(DecodeError(der), "The certificate is followed by other bytes.");
}

TEST(CertificateTest, ReportsWhyItCannotBeDecoded) {
  EXPECT_THAT(DecodeError({'n', 'o', 'n', 'e'}), StartsWith("The certificate cannot be decoded: "));
}

TEST(CertificateTest, LeavesTheErrorQueueUnchanged) {
  ERR_clear_error();
  DecodeError({'n', 'o', 'n', 'e'});
  PemError("-----BEGIN CERTIFICATE-----\n");
  MakeCertificate({.commonName = "clean queue"});
  EXPECT_EQ(ERR_peek_error(), 0U);

  ERR_raise(ERR_LIB_USER, 77);
  const unsigned long before = ERR_peek_error();
  DecodeError({'n', 'o', 'n', 'e'});
  EXPECT_EQ(ERR_peek_last_error(), before);
  ERR_clear_error();
}

struct KeyCase {
  const char* name;
  OpenSsl::OwnedKey (*make)();
  KeyAlgorithm algorithm;
  int bits;
};

class CertificateKeyTest : public testing::TestWithParam<KeyCase> {};

TEST_P(CertificateKeyTest, ReportsAlgorithmAndSize) {
  const OpenSsl::OwnedKey key = GetParam().make();
  const auto publicKey = MakeCertificate({.key = key.get()})->GetPublicKey();
  EXPECT_EQ(publicKey->Algorithm(), GetParam().algorithm);
  EXPECT_EQ(publicKey->Bits(), GetParam().bits);
}

INSTANTIATE_TEST_SUITE_P(
    Keys, CertificateKeyTest,
    testing::Values(KeyCase{"Rsa1024", [] { return MakeRsaKey(1024); }, KeyAlgorithm::kRsa, 1024},
                    KeyCase{"Rsa2048", [] { return MakeRsaKey(2048); }, KeyAlgorithm::kRsa, 2048},
                    KeyCase{"P256", [] { return MakeEcKey("P-256"); }, KeyAlgorithm::kEc, 256},
                    KeyCase{"P521", [] { return MakeEcKey("P-521"); }, KeyAlgorithm::kEc, 521},
                    KeyCase{"Ed25519", [] { return MakeKey("ED25519"); }, KeyAlgorithm::kOther,
                            256}),
    [](const auto& tested) { return tested.param.name; });

TEST(CertificateTest, PublicKeyOutlivesIt) {
  auto certificate = MakeCertificate({.commonName = "short-lived"});
  const auto key = certificate->GetPublicKey();
  EXPECT_EQ(key, certificate->GetPublicKey());
  certificate.reset();
  EXPECT_EQ(key->Bits(), 2048);
}

TEST(CertificatesFromPemTest, ReadsEveryCertificateInOrderAndSkipsOtherBlocks) {
  const auto one = MakeCertificateDer({.commonName = "one"});
  const auto two = MakeCertificateDer({.commonName = "two"});
  const auto certificates = CreateCertificatesFromPem(
      "subject: one\n" + ToPem(one) + ToPem({1, 2, 3}, "PRIVATE KEY") + "\n" + ToPem(two) + "end");
  ASSERT_EQ(certificates.size(), 2U);
  EXPECT_EQ(certificates[0]->SubjectName(), "CN=one,O=Test\\, Inc.");
  EXPECT_EQ(certificates[1]->SubjectName(), "CN=two,O=Test\\, Inc.");
}

TEST(CertificatesFromPemTest, RefusesTextWithoutCertificates) {
  EXPECT_EQ(PemError(""), "The PEM text holds no certificate.");
  EXPECT_EQ(PemError("nothing here"), "The PEM text holds no certificate.");
  EXPECT_EQ(PemError("0"), "The PEM text holds no certificate.");
  const auto der = MakeCertificateDer();
  EXPECT_EQ(PemError({der.begin(), der.end()}), "The PEM text holds no certificate: it is DER.");
  EXPECT_EQ(PemError(ToPem({1, 2, 3}, "PUBLIC KEY")), "The PEM text holds no certificate.");
}

TEST(CertificatesFromPemTest, RefusesABrokenBlockNextToValidOnes) {
  const std::string good = ToPem(MakeCertificateDer());
  EXPECT_EQ(PemError(good + good), "accepted");
  EXPECT_THAT(PemError(good + good.substr(0, good.size() / 2)),
              StartsWith("The PEM text is broken: "));
  EXPECT_THAT(PemError(good + ToPem({1, 2, 3})), StartsWith("The certificate cannot be decoded"));
}

TEST(LoadCertificatesTest, ReturnsTheCertificatesOfTheFile) {
  const TemporaryFile file(ToPem(MakeCertificateDer({.commonName = "from a file"})));
  const auto certificates = LoadCertificates(file.Path());
  ASSERT_EQ(certificates.size(), 1U);
  EXPECT_EQ(certificates[0]->SubjectName(), "CN=from a file,O=Test\\, Inc.");
}

TEST(LoadCertificatesTest, RefusesAFileWithoutCertificates) {
  const TemporaryFile file("");
  EXPECT_EQ(ThrownMessage<CryptoException>([&file] { LoadCertificates(file.Path()); }),
            "The certificate file '" + file.Path() +
                "' cannot be used: The PEM text holds no certificate.");
}

TEST(LoadCertificatesTest, NamesTheFileThatCannotBeRead) {
  EXPECT_EQ(ThrownMessage<IOException>([] { LoadCertificates("/nonexistent/ca.pem"); }),
            "The certificate file '/nonexistent/ca.pem' cannot be read: No such file or "
            "directory.");
}

TEST(LoadCertificatesTest, RefusesADirectory) {
  EXPECT_THAT(ThrownMessage<IOException>([] { LoadCertificates("/"); }),
              HasSubstr("Is a directory"));
}

TEST(PemOrDerCertificatesTest, AreReadFromBothForms) {
  const auto der = MakeCertificateDer({.commonName = "in either form"});
  const std::string pem = ToPem(MakeCertificateDer({.commonName = "first"})) + ToPem(der);
  const TemporaryFile pemFile("0 is where this text starts.\n" + pem);
  const TemporaryFile derFile({der.begin(), der.end()});
  ASSERT_EQ(LoadPemOrDerCertificates(pemFile.Path()).size(), 2U);
  ASSERT_EQ(LoadPemOrDerCertificates(derFile.Path()).size(), 1U);
  EXPECT_EQ(LoadPemOrDerCertificates(pemFile.Path())[1],
            LoadPemOrDerCertificates(derFile.Path())[0]);
}

// Each reader finds the same certificates in a file, whatever else it contains.
TEST(PemOrDerCertificatesTest, AreNotReadFromAPemTextWithinDer) {
  const auto der = MakeCertificateDer(
      {.commonName = "outer", .comment = "\n" + ToPem(MakeCertificateDer()) + "\n"});
  const auto read =
      CreateCertificatesFromPemOrDer({reinterpret_cast<const char*>(der.data()), der.size()});
  ASSERT_EQ(read.size(), 1U);
  EXPECT_EQ(read[0]->SubjectName(), "CN=outer,O=Test\\, Inc.");
}

TEST(PemOrDerCertificatesTest, AreRefusedWithTheNameOfTheFile) {
  const auto der = MakeCertificateDer();
  const TemporaryFile half(std::string(der.begin(), der.begin() + 100));
  EXPECT_THAT(ThrownMessage<CryptoException>([&] { LoadPemOrDerCertificates(half.Path()); }),
              StartsWith("The certificate file '" + half.Path() +
                         "' cannot be used: The certificate cannot be decoded: "));
  const TemporaryFile text("0\xC3\xA9");
  EXPECT_EQ(ThrownMessage<CryptoException>([&] { LoadPemOrDerCertificates(text.Path()); }),
            "The certificate file '" + text.Path() +
                "' cannot be used: The PEM text holds no certificate.");
  EXPECT_THAT(ThrownMessage<IOException>([] { LoadPemOrDerCertificates("/nonexistent/a.cer"); }),
              HasSubstr("/nonexistent/a.cer"));
}

/// A certificate of a caller's own class.
class CallersCertificate final : public Certificate, public ObjectImpl {
 public:
  explicit CallersCertificate(std::vector<unsigned char> der) : der_(std::move(der)) {}

  const unsigned char* DerBytes() const noexcept override { return der_.data(); }
  std::size_t DerLength() const noexcept override { return der_.size(); }
  const std::string& SubjectName() const override { return text_; }
  const std::string& IssuerName() const override { return text_; }
  const std::string& SerialNumber() const override { return text_; }
  System::DateTime NotBefore() const override { return {}; }
  System::DateTime NotAfter() const override { return {}; }
  const std::vector<unsigned char>& SubjectKeyIdentifier() const override { return der_; }
  Ref<const PublicKey> GetPublicKey() const override { return nullptr; }

 private:
  std::vector<unsigned char> der_;
  std::string text_;
};

TEST(CertificateIdentityTest, IsThatOfTheBytes) {
  const auto der = MakeCertificateDer({.commonName = "same"});
  const auto certificate = CreateCertificateFromDer(der.data(), der.size());
  EXPECT_TRUE(IsSameCertificate(*certificate, *certificate));
  EXPECT_TRUE(IsSameCertificate(*certificate, CallersCertificate(der)));
  EXPECT_TRUE(IsSameCertificate(CallersCertificate({}), CallersCertificate({})));
}

// Two certificates of one key, subject, issuer and serial number may differ only in their last bit.
TEST(CertificateIdentityTest, CoversEveryByte) {
  const auto der = MakeCertificateDer();
  const CallersCertificate certificate(der);
  for (std::size_t i = 0; i < der.size(); ++i) {
    auto other = der;
    other[i] ^= 1;
    ASSERT_FALSE(IsSameCertificate(certificate, CallersCertificate(other))) << i;
    ASSERT_NE(Fingerprint(certificate), Fingerprint(CallersCertificate(other))) << i;
  }
  const CallersCertificate shorter({der.begin(), der.end() - 1});
  EXPECT_FALSE(IsSameCertificate(certificate, shorter));
  EXPECT_FALSE(IsSameCertificate(shorter, certificate));
}

TEST(CertificateIdentityTest, HasAFingerprintOfTheBytes) {
  const auto der = MakeCertificateDer({.commonName = "fingerprint"});
  const auto certificate = CreateCertificateFromDer(der.data(), der.size());
  const Sha256Digest expected = Sha256({reinterpret_cast<const char*>(der.data()), der.size()});
  EXPECT_EQ(Fingerprint(*certificate), expected);
  EXPECT_EQ(Fingerprint(*certificate), expected);  // remembered
  EXPECT_EQ(Fingerprint(CallersCertificate(der)), expected);
}

// As `openssl x509 -fingerprint -sha256` prints it.
TEST(CertificateIdentityTest, HasAFingerprintTextInTheUsualForm) {
  EXPECT_EQ(
      FingerprintText(CallersCertificate({'a', 'b', 'c'})),
      "BA:78:16:BF:8F:01:CF:EA:41:41:40:DE:5D:AE:22:23:B0:03:61:A3:96:17:7A:9C:B4:10:FF:61:F2:"
      "00:15:AD");
}

TEST(CertificateIdentityTest, HasAFingerprintForManyThreadsAtOnce) {
  const auto certificate = MakeCertificate({.commonName = "fingerprint of threads"});
  const Sha256Digest expected =
      Sha256({reinterpret_cast<const char*>(certificate->DerBytes()), certificate->DerLength()});
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&] { wrong += Fingerprint(*certificate) == expected ? 0 : 1; });
  }
  for (std::thread& thread : threads) {
    thread.join();
  }
  EXPECT_EQ(wrong, 0);
}

TEST(CertificateTest, MayBeCreatedByManyThreadsAtOnce) {
  std::vector<std::vector<unsigned char>> encodings;
  for (int i = 0; i < 4; ++i) {
    encodings.push_back(MakeCertificateDer({.commonName = "shared " + std::to_string(i)}));
  }
  std::atomic<int> wrong{0};
  std::vector<std::thread> threads;
  for (int t = 0; t < 4; ++t) {
    threads.emplace_back([&] {
      for (int i = 0; i < 200; ++i) {
        const auto& der = encodings[static_cast<std::size_t>(i) % encodings.size()];
        const auto certificate = CreateCertificateFromDer(der.data(), der.size());
        wrong += certificate->DerLength() == der.size() ? 0 : 1;
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
