#include <tarnik/crypto/certificate.h>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/err.h>
#include <openssl/pem.h>

#include <tarnik/crypto/crypto_exception.h>
#include <atomic>
#include <cstdio>
#include <fstream>
#include <thread>

#include "support/test_certificates.h"

namespace Tarnik::Crypto {
namespace {

using ::testing::HasSubstr;
using ::testing::IsEmpty;
using ::testing::StartsWith;
using Tests::CertificateRecipe;
using Tests::MakeCertificate;
using Tests::MakeCertificateDer;

std::string ToPem(const std::vector<unsigned char>& der, const char* label = "CERTIFICATE") {
  const OpenSsl::OwnedBio memory(BIO_new(BIO_s_mem()));
  PEM_write_bio(memory.get(), label, "", der.data(), static_cast<long>(der.size()));
  char* text = nullptr;
  const long length = BIO_get_mem_data(memory.get(), &text);
  return {text, static_cast<std::size_t>(length)};
}

std::string DecodeError(const std::vector<unsigned char>& der) {
  try {
    CreateCertificateFromDer(der.data(), der.size());
  } catch (const CryptoException& error) {
    return error.Message();
  }
  return "accepted";
}

std::string PemError(const std::string& pem) {
  try {
    CreateCertificatesFromPem(pem);
  } catch (const CryptoException& error) {
    return error.Message();
  }
  return "accepted";
}

TEST(Certificate, TellsItsFields) {
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

TEST(Certificate, EscapesControlCharactersInNames) {
  const auto certificate = MakeCertificate({.commonName = std::string("a\0b", 3)});
  EXPECT_EQ(certificate->SubjectName(), "CN=a\\00b,O=Test\\, Inc.");
}

TEST(Certificate, TellsTimesBefore1970AndAtTheEndOfTheCalendar) {
  const auto certificate =
      MakeCertificate({.notBefore = "19500101000000Z", .notAfter = "99991231235959Z"});
  EXPECT_EQ(certificate->NotBefore().ToString(), "1950-01-01T00:00:00.000Z");
  EXPECT_EQ(certificate->NotAfter().ToString(), "9999-12-31T23:59:59.000Z");
}

TEST(Certificate, GivesItsBytesAsTheyCame) {
  const auto der = MakeCertificateDer();
  const auto certificate = CreateCertificateFromDer(der.data(), der.size());
  EXPECT_EQ(std::vector<unsigned char>(certificate->DerBytes(),
                                       certificate->DerBytes() + certificate->DerLength()),
            der);
}

TEST(Certificate, TellsTheSubjectKeyIdentifier) {
  EXPECT_EQ(MakeCertificate({.withKeyIdentifier = true})->SubjectKeyIdentifier().size(), 20U);
  EXPECT_THAT(MakeCertificate()->SubjectKeyIdentifier(), IsEmpty());
}

TEST(Certificate, IsNotDecodedAgainWhenItsBytesAreKnown) {
  const auto der = MakeCertificateDer({.commonName = "decoded once"});
  const auto copy = der;
  const auto first = CreateCertificateFromDer(der.data(), der.size());
  EXPECT_EQ(first, CreateCertificateFromDer(copy.data(), copy.size()));
}

TEST(Certificate, DiffersFromOneWithOtherBytes) {
  EXPECT_NE(MakeCertificate({.commonName = "one"}), MakeCertificate({.commonName = "two"}));
}

TEST(Certificate, RefusesEveryShorterPiece) {
  auto der = MakeCertificateDer();
  while (!der.empty()) {
    der.pop_back();
    ASSERT_NE(DecodeError(der), "accepted") << der.size();
  }
  EXPECT_EQ(DecodeError({}), "A certificate cannot be empty.");
}

TEST(Certificate, RefusesTrailingBytes) {
  auto der = MakeCertificateDer();
  ASSERT_EQ(DecodeError(der), "accepted");
  der.push_back(0);
  EXPECT_EQ(DecodeError(der), "The certificate is followed by other bytes.");
}

TEST(Certificate, NamesWhatCannotBeDecodedAndWhy) {
  EXPECT_THAT(DecodeError({'n', 'o', 'n', 'e'}), StartsWith("The certificate cannot be decoded: "));
}

TEST(Certificate, LeavesTheErrorQueueAsItWas) {
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

class CertificateKey : public ::testing::TestWithParam<KeyCase> {};

TEST_P(CertificateKey, TellsAlgorithmAndSize) {
  const OpenSsl::OwnedKey key = GetParam().make();
  const auto publicKey = MakeCertificate({.key = key.get()})->GetPublicKey();
  EXPECT_EQ(publicKey->Algorithm(), GetParam().algorithm);
  EXPECT_EQ(publicKey->Bits(), GetParam().bits);
}

INSTANTIATE_TEST_SUITE_P(
    Keys, CertificateKey,
    ::testing::Values(
        KeyCase{"Rsa1024", [] { return Tests::MakeRsaKey(1024); }, KeyAlgorithm::kRsa, 1024},
        KeyCase{"Rsa2048", [] { return Tests::MakeRsaKey(2048); }, KeyAlgorithm::kRsa, 2048},
        KeyCase{"P256", [] { return Tests::MakeEcKey("P-256"); }, KeyAlgorithm::kEc, 256},
        KeyCase{"P521", [] { return Tests::MakeEcKey("P-521"); }, KeyAlgorithm::kEc, 521},
        KeyCase{"Ed25519", [] { return Tests::MakeKey("ED25519"); }, KeyAlgorithm::kOther, 256}),
    [](const auto& tested) { return tested.param.name; });

TEST(Certificate, KeepsItsPublicKeyAliveWithoutItself) {
  auto certificate = MakeCertificate({.commonName = "short-lived"});
  const auto key = certificate->GetPublicKey();
  EXPECT_EQ(key, certificate->GetPublicKey());
  certificate.reset();
  EXPECT_EQ(key->Bits(), 2048);
}

TEST(CertificatesFromPem, ReadsEveryCertificateInOrderAndSkipsOtherBlocks) {
  const auto one = MakeCertificateDer({.commonName = "one"});
  const auto two = MakeCertificateDer({.commonName = "two"});
  const auto certificates = CreateCertificatesFromPem(
      "subject: one\n" + ToPem(one) + ToPem({1, 2, 3}, "PRIVATE KEY") + "\n" + ToPem(two) + "end");
  ASSERT_EQ(certificates.size(), 2U);
  EXPECT_EQ(certificates[0]->SubjectName(), "CN=one,O=Test\\, Inc.");
  EXPECT_EQ(certificates[1]->SubjectName(), "CN=two,O=Test\\, Inc.");
}

TEST(CertificatesFromPem, RefusesTextWithoutCertificates) {
  EXPECT_EQ(PemError(""), "The PEM text holds no certificate.");
  EXPECT_EQ(PemError("nothing here"), "The PEM text holds no certificate.");
  EXPECT_EQ(PemError(ToPem({1, 2, 3}, "PUBLIC KEY")), "The PEM text holds no certificate.");
}

TEST(CertificatesFromPem, RefusesABrokenBlockBesideGoodOnes) {
  const std::string good = ToPem(MakeCertificateDer());
  EXPECT_EQ(PemError(good + good), "accepted");
  EXPECT_THAT(PemError(good + good.substr(0, good.size() / 2)),
              StartsWith("The PEM text is broken: "));
  EXPECT_THAT(PemError(good + ToPem({1, 2, 3})), StartsWith("The certificate cannot be decoded"));
}

class LoadedCertificates : public ::testing::Test {
 protected:
  void SetUp() override {
    std::string name = ::testing::TempDir() + "certificates-XXXXXX";
    const int descriptor = mkstemp(name.data());
    ASSERT_GE(descriptor, 0);
    close(descriptor);
    path_ = name;
  }
  void TearDown() override { std::remove(path_.c_str()); }

  std::string path_;
};

TEST_F(LoadedCertificates, AreThoseOfTheFile) {
  std::ofstream(path_) << ToPem(MakeCertificateDer({.commonName = "from a file"}));
  const auto certificates = LoadCertificates(path_);
  ASSERT_EQ(certificates.size(), 1U);
  EXPECT_EQ(certificates[0]->SubjectName(), "CN=from a file,O=Test\\, Inc.");
}

TEST_F(LoadedCertificates, AreRefusedWhenTheFileHoldsNone) {
  try {
    LoadCertificates(path_);
    FAIL() << "accepted";
  } catch (const CryptoException& error) {
    EXPECT_EQ(error.Message(), "The certificate file '" + path_ +
                                   "' cannot be used: The PEM text holds no certificate.");
  }
}

TEST(LoadCertificates, NamesTheFileThatCannotBeRead) {
  try {
    LoadCertificates("/nonexistent/ca.pem");
    FAIL() << "accepted";
  } catch (const IOException& error) {
    EXPECT_EQ(error.Message(),
              "The certificate file '/nonexistent/ca.pem' cannot be read: No such file or "
              "directory.");
  }
}

TEST(LoadCertificates, RefusesADirectory) {
  try {
    LoadCertificates("/");
    FAIL() << "accepted";
  } catch (const IOException& error) {
    EXPECT_THAT(error.Message(), HasSubstr("Is a directory"));
  }
}

TEST(Certificate, MayBeMadeByManyThreadsAtOnce) {
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
}  // namespace Tarnik::Crypto
