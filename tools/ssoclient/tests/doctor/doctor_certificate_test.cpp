// Findings about the certificates of the service, each produced for real.
#include <chrono>
#include <string>
#include <utility>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/x509.h>

#include "devsts/certificates.h"
#include "devsts/server.h"
#include "support/doctor_run.h"
#include "support/peer.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace SsoClient::Tool::Testing {
namespace {

using DevSts::CertificateSpec;
using DevSts::Credential;
using DevSts::ServerCertificate;
using Tarnik::Testing::Identity;
using Tarnik::Testing::IdentityOptions;
using Tarnik::Testing::TemporaryFile;
using testing::HasSubstr;
using testing::StartsWith;

constexpr std::chrono::hours kDay{24};

Credential MakeCa(const std::string& name, bool freshKey = false,
                  const Credential* issuer = nullptr) {
  CertificateSpec spec;
  spec.commonName = name;
  spec.isAuthority = true;
  spec.freshKey = freshKey;
  spec.notAfter = 100 * kDay;
  return DevSts::MakeCertificate(spec, issuer);
}

CertificateSpec ServerSpec() {
  CertificateSpec spec;
  spec.commonName = "service";
  spec.addresses = {"127.0.0.1"};
  spec.notAfter = 100 * kDay;
  return spec;
}

// Examines a dev STS with such a certificate, trusting its CA.
DoctorRun Examine(ServerCertificate certificate) {
  DevSts::ServerOptions options;
  options.tls.certificate = certificate;
  const DevSts::Server sts(options);
  const TemporaryFile ca(sts.CaCertificatePem());
  return RunDoctor(sts.HttpsUrlFor("localhost"), {"--ca", ca.Path()});
}

// The same for a service that only speaks TLS.
DoctorRun Examine(const Credential& server, const std::string& chain, const std::string& ca,
                  const std::vector<std::string>& arguments = {}) {
  const Peer peer(TlsPeer(server.certificatePem, server.privateKeyPem, chain));
  const TemporaryFile file(ca);
  std::vector<std::string> all = {"--ca", file.Path(), "--timeout", "6"};
  all.insert(all.end(), arguments.begin(), arguments.end());
  return RunDoctor(peer.Url(), all);
}

// What is printed for people about a service that only speaks TLS.
std::string Print(const Credential& server, const std::string& chain, const std::string& ca) {
  const Peer peer(TlsPeer(server.certificatePem, server.privateKeyPem, chain));
  const TemporaryFile file(ca);
  return RunTool({"doctor", "--url", peer.Url(), "--ca", file.Path()}).out;
}

TEST(DoctorCertificateTest, AValidChainIsAcceptedAndShown) {
  for (const auto certificate :
       {ServerCertificate::Valid, ServerCertificate::ThroughIntermediate}) {
    const DoctorRun run = Examine(certificate);
    EXPECT_EQ(run.Finding("certificate"), "ok") << run.Text();
    EXPECT_EQ(run.Detail("certificate", "/isAcceptedByLibrary"), "true");
    EXPECT_EQ(run.Detail("certificate", "/chain/0/subject"), "\"CN=Dev STS server\"");
    EXPECT_EQ(run.Detail("certificate", "/chain/0/names"), "[\"localhost\",\"127.0.0.1\",\"::1\"]");
    EXPECT_EQ(run.Detail("certificate", "/chain/0/fingerprint").size(), 32U * 3 - 1 + 2);
  }
}

TEST(DoctorCertificateTest, EachFaultOfACertificateIsFoundAndRefusedByTheLibrary) {
  const std::pair<ServerCertificate, const char*> cases[] = {
      {ServerCertificate::Expired, "expired"},
      {ServerCertificate::NotYetValid, "not-yet-valid"},
      {ServerCertificate::SelfSigned, "self-signed"},
      {ServerCertificate::WrongHost, "wrong-name"},
      {ServerCertificate::NameOnlyInCommonName, "wrong-name"},
      {ServerCertificate::MissingIntermediate, "unknown-issuer"},
  };
  for (const auto& [certificate, finding] : cases) {
    const DoctorRun run = Examine(certificate);
    ExpectFailure(run, "certificate", finding, 3, "http");
    EXPECT_EQ(run.Detail("certificate", "/isAcceptedByLibrary"), "false");
  }
}

TEST(DoctorCertificateTest, AWrongNameNamesTheOthers) {
  EXPECT_THAT(Examine(ServerCertificate::WrongHost).Message("certificate"),
              HasSubstr("elsewhere.example"));
  EXPECT_THAT(Examine(ServerCertificate::NameOnlyInCommonName).Message("certificate"),
              HasSubstr("no subjectAltName"));
}

TEST(DoctorCertificateTest, TheCaThatIsNeededIsNamed) {
  const Credential root = MakeCa("Needed root");
  const Credential intermediate = MakeCa("Intermediate", false, &root);
  const Credential other = MakeCa("Other root");
  const Credential server = DevSts::MakeCertificate(ServerSpec(), &intermediate);
  for (const std::string& chain :
       {intermediate.certificatePem, intermediate.certificatePem + root.certificatePem}) {
    const DoctorRun run = Examine(server, chain, other.certificatePem);
    ExpectFailure(run, "certificate", "unknown-ca", 3, "http");
    EXPECT_THAT(run.Message("certificate"), HasSubstr("CN=Needed root"));
  }
  const DoctorRun single = Examine(server, "", other.certificatePem);
  ExpectFailure(single, "certificate", "unknown-issuer", 3, "http");
  EXPECT_THAT(single.Message("certificate"), HasSubstr("CN=Intermediate"));
}

TEST(DoctorCertificateTest, AChainThatIsNotTrustedIsShown) {
  const Credential root = MakeCa("Needed root");
  const Credential intermediate = MakeCa("Intermediate", false, &root);
  const Credential other = MakeCa("Other root");
  const Credential server = DevSts::MakeCertificate(ServerSpec(), &intermediate);
  const std::string chain = intermediate.certificatePem + root.certificatePem;
  const DoctorRun run = Examine(server, chain, other.certificatePem);
  ExpectFailure(run, "certificate", "unknown-ca", 3, "http");
  EXPECT_EQ(run.Detail("certificate", "/chain/0/subject"), "\"CN=service\"");
  EXPECT_EQ(run.Detail("certificate", "/chain/1/subject"), "\"CN=Intermediate\"");
  EXPECT_EQ(run.Detail("certificate", "/chain/2/subject"), "\"CN=Needed root\"");
  EXPECT_EQ(run.Detail("certificate", "/chain/2/issuer"), "\"CN=Needed root\"");

  const std::string printed = Print(server, chain, other.certificatePem);
  EXPECT_THAT(printed, HasSubstr("failed  certificate"));
  for (const char* const line :
       {" 0: CN=service\n", " 1: CN=Intermediate\n", " 2: CN=Needed root\n"}) {
    EXPECT_THAT(printed, HasSubstr(line));
  }
  EXPECT_THAT(printed, HasSubstr(" SHA-256 "));
}

TEST(DoctorCertificateTest, ACaWithANewKeyIsFound) {
  const Credential old = MakeCa("Renewed root", true);
  const Credential current = MakeCa("Renewed root", true);
  const Credential server = DevSts::MakeCertificate(ServerSpec(), &current);
  ExpectFailure(Examine(server, "", old.certificatePem), "certificate", "ca-replaced", 3, "http");
}

TEST(DoctorCertificateTest, ACertificateThatExpiresSoonIsAWarning) {
  const Credential root = MakeCa("Root");
  CertificateSpec spec = ServerSpec();
  spec.notAfter = 10 * kDay + std::chrono::hours(1);
  const DoctorRun run = Examine(DevSts::MakeCertificate(spec, &root), "", root.certificatePem);
  ExpectWarning(run, "certificate", "expires-soon");
  EXPECT_THAT(run.Message("certificate"), HasSubstr("in 10 days"));
  EXPECT_NE(run.Outcome("http"), "skipped");
}

TEST(DoctorCertificateTest, ACertificateForClientsIsNotTrusted) {
  const Identity root = Tarnik::Testing::MakeCa("Root");
  IdentityOptions forClients{.dnsNames = {}, .addresses = {"127.0.0.1"}};
  forClients.extendedKeyUsage = "clientAuth";
  const Identity client = Tarnik::Testing::MakeIdentity(forClients, &root);
  const DoctorRun run = Examine({client.Pem(), client.KeyPem()}, "", root.Pem());
  ExpectFailure(run, "certificate", "not-trusted", 3, "http");
  EXPECT_EQ(run.Detail("certificate", "/isAcceptedByLibrary"), "false");
}

TEST(DoctorCertificateTest, ACertificateThatCannotBeReadIsAFaultOfTheService) {
  const Identity root = Tarnik::Testing::MakeCa("Root");
  const IdentityOptions options{.dnsNames = {}, .addresses = {"127.0.0.1"}};
  const Identity server = Tarnik::Testing::MakeIdentity(options, &root);
  ASN1_TIME* const noTime = ASN1_STRING_type_new(V_ASN1_UTCTIME);
  ASN1_STRING_set(noTime, "269901000000Z", -1);
  X509_set1_notAfter(server.certificate.get(), noTime);
  ASN1_STRING_free(noTime);
  const DoctorRun run = Examine({server.Pem(), server.KeyPem()}, "", root.Pem());
  ExpectFailure(run, "certificate", "not-trusted", 3, "http");
  EXPECT_THAT(run.Message("certificate"), HasSubstr("cannot be read"));
}

TEST(DoctorCertificateTest, ThePeerNameReplacesTheHost) {
  const Credential root = MakeCa("Root");
  CertificateSpec spec = ServerSpec();
  spec.addresses.clear();
  spec.dnsNames = {"sts.example"};
  const Credential server = DevSts::MakeCertificate(spec, &root);
  EXPECT_EQ(Examine(server, "", root.certificatePem, {"--peer-name", "sts.example"})
                .Finding("certificate"),
            "ok");
  EXPECT_EQ(Examine(server, "", root.certificatePem).Finding("certificate"), "wrong-name");
}

TEST(DoctorCertificateTest, ACaThatIsNotOneIsNotTrusted) {
  CertificateSpec spec = ServerSpec();
  spec.commonName = "no CA";
  const Credential pretender = DevSts::MakeCertificate(spec);
  const Credential server = DevSts::MakeCertificate(ServerSpec(), &pretender);
  const DoctorRun run = Examine(server, "", pretender.certificatePem);
  EXPECT_EQ(run.Outcome("certificate"), "failed");
  EXPECT_EQ(run.Detail("certificate", "/isAcceptedByLibrary"), "false") << run.Text();
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
