// Findings about revocation and about services that differ, each produced for real.
#include <atomic>
#include <chrono>
#include <memory>
#include <stdexcept>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/pem.h>
#include <openssl/x509.h>

#include "devsts/certificates.h"
#include "support/doctor_run.h"
#include "support/peer.h"
#include "support/temporary_file.h"

namespace SsoClient::Tool::Testing {
namespace {

using DevSts::CertificateSpec;
using DevSts::Credential;
using Tarnik::Testing::TemporaryFile;
using testing::HasSubstr;

constexpr std::chrono::hours kDay{24};

std::shared_ptr<X509> Load(const std::string& pem) {
  const std::shared_ptr<BIO> bio(BIO_new_mem_buf(pem.data(), static_cast<int>(pem.size())),
                                 BIO_free);
  return {PEM_read_bio_X509(bio.get(), nullptr, nullptr, nullptr), X509_free};
}

// A list of the issuer, whose next update is in `days`, with the certificate unless it is empty.
std::string MakeList(const Credential& issuer, const std::string& revoked, long days = 30) {
  const std::shared_ptr<BIO> keyText(
      BIO_new_mem_buf(issuer.privateKeyPem.data(), static_cast<int>(issuer.privateKeyPem.size())),
      BIO_free);
  const std::shared_ptr<EVP_PKEY> key(
      PEM_read_bio_PrivateKey(keyText.get(), nullptr, nullptr, nullptr), EVP_PKEY_free);
  const std::shared_ptr<X509_CRL> list(X509_CRL_new(), X509_CRL_free);
  const std::shared_ptr<ASN1_TIME> from(X509_gmtime_adj(nullptr, -100L * 24 * 3600),
                                        ASN1_TIME_free);
  const std::shared_ptr<ASN1_TIME> until(X509_gmtime_adj(nullptr, days * 24 * 3600),
                                         ASN1_TIME_free);
  X509_CRL_set_version(list.get(), X509_CRL_VERSION_2);
  X509_CRL_set_issuer_name(list.get(), X509_get_subject_name(Load(issuer.certificatePem).get()));
  X509_CRL_set1_lastUpdate(list.get(), from.get());
  X509_CRL_set1_nextUpdate(list.get(), until.get());
  if (!revoked.empty()) {
    X509_REVOKED* const entry = X509_REVOKED_new();
    X509_REVOKED_set_serialNumber(entry, X509_get_serialNumber(Load(revoked).get()));
    X509_REVOKED_set_revocationDate(entry, from.get());
    X509_CRL_add0_revoked(list.get(), entry);
  }
  const std::shared_ptr<BIO> text(BIO_new(BIO_s_mem()), BIO_free);
  if (X509_CRL_sign(list.get(), key.get(), EVP_sha256()) <= 0 ||
      PEM_write_bio_X509_CRL(text.get(), list.get()) != 1) {
    throw std::runtime_error("cannot make a revocation list");
  }
  char* octets = nullptr;
  const long size = BIO_get_mem_data(text.get(), &octets);
  return {octets, static_cast<std::size_t>(size)};
}

class DoctorRevocationTest : public testing::Test {
 protected:
  static Credential MakeRoot() {
    CertificateSpec spec;
    spec.commonName = "Root with lists";
    spec.isAuthority = true;
    spec.notAfter = 100 * kDay;
    return DevSts::MakeCertificate(spec);
  }

  Credential MakeService(std::chrono::seconds notAfter = 100 * kDay) const {
    CertificateSpec spec;
    spec.commonName = "service";
    spec.addresses = {"127.0.0.1"};
    spec.notBefore = -200 * kDay;
    spec.notAfter = notAfter;
    return DevSts::MakeCertificate(spec, &root);
  }

  DoctorRun RunWithList(const std::string& text) const {
    const Peer peer(TlsPeer(service.certificatePem, service.privateKeyPem));
    const TemporaryFile list(text);
    return RunDoctor(peer.Url(), {"--ca", ca.Path(), "--tls-crl", list.Path(), "--timeout", "6"});
  }

  Credential root = MakeRoot();
  Credential service = MakeService();
  TemporaryFile ca{root.certificatePem};
};

TEST_F(DoctorRevocationTest, ARevokedCertificateIsFoundAndRefusedByTheLibrary) {
  const DoctorRun run = RunWithList(MakeList(root, service.certificatePem));
  ExpectFailure(run, "certificate", "revoked", 3, "http");
  EXPECT_EQ(run.Detail("certificate", "/isAcceptedByLibrary"), "false");
  EXPECT_EQ(RunWithList(MakeList(root, "")).Finding("certificate"), "ok");
}

TEST_F(DoctorRevocationTest, AListThatIsOutOfDateOrOfAnotherIssuerIsFound) {
  ExpectFailure(RunWithList(MakeList(root, "", -1)), "certificate", "revocation-unknown", 3,
                "http");
  CertificateSpec spec;
  spec.commonName = "Another root";
  spec.isAuthority = true;
  ExpectFailure(RunWithList(MakeList(DevSts::MakeCertificate(spec), "")), "certificate",
                "revocation-unknown", 3, "http");
}

TEST_F(DoctorRevocationTest, ConnectionsToDifferentServicesAreFound) {
  const Credential expired = MakeService(-kDay);
  for (const bool isGoodFirst : {true, false}) {
    const auto good = TlsPeer(service.certificatePem, service.privateKeyPem);
    const auto bad = TlsPeer(expired.certificatePem, expired.privateKeyPem);
    // The connection of the TCP step, the probe and the library.
    std::atomic<int> count = 0;
    const Peer peer([&](int descriptor) {
      const bool isFirst = ++count <= 2;
      (isFirst == isGoodFirst ? good : bad)(descriptor);
    });
    const DoctorRun run = RunDoctor(peer.Url(), {"--ca", ca.Path(), "--timeout", "6"});
    ExpectFailure(run, "certificate", "verdicts-differ", 3, "http");
    EXPECT_THAT(run.Message("certificate"), HasSubstr(isGoodFirst ? "refuses" : "accepts"));
  }
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
