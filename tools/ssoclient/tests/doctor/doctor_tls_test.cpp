// Findings about what a port speaks, each produced for real.
#include <atomic>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/socket.h>

#include "devsts/server.h"
#include "support/doctor_run.h"
#include "support/peer.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"

namespace SsoClient::Tool::Testing {
namespace {

using Tarnik::Testing::Identity;
using Tarnik::Testing::TemporaryFile;
using testing::HasSubstr;

// Replaces the scheme of the URL.
std::string WithScheme(const std::string& scheme, const std::string& url) {
  return scheme + url.substr(url.find(':'));
}

// Runs doctor with little time and one CA, whose file is read quickly, unlike those of the system.
DoctorRun RunBriefly(const std::string& url) {
  const TemporaryFile ca(Tarnik::Testing::MakeCa("CA").Pem());
  return RunDoctor(url, {"--timeout", "1.5", "--ca", ca.Path()});
}

TEST(DoctorTlsTest, PlainHttpOnTheHttpsPortIsFound) {
  const DevSts::Server sts;
  ExpectFailure(RunDoctor(WithScheme("https", sts.HttpUrl())), "tls", "http-on-https-port", 3,
                "certificate");
  const Peer refusing(Answering("HTTP/1.1 400 Bad Request\r\nConnection: close\r\n\r\n"));
  ExpectFailure(RunDoctor(refusing.Url()), "tls", "http-on-https-port", 3, "certificate");
}

TEST(DoctorTlsTest, TlsOnTheHttpPortIsFound) {
  const DevSts::Server sts;
  ExpectFailure(RunDoctor(WithScheme("http", sts.HttpsUrl())), "http", "https-on-http-port", 3,
                "sts");
}

TEST(DoctorTlsTest, AnotherProtocolIsFoundAndShown) {
  const Peer mail(Greeting("220 mail.example ESMTP\r\n"));
  const DoctorRun run = RunDoctor(mail.Url());
  ExpectFailure(run, "tls", "not-tls", 3, "certificate");
  EXPECT_THAT(run.Message("tls"), HasSubstr("220 mail.example ESMTP"));
}

TEST(DoctorTlsTest, ASilentServiceTakesOnlyAThirdOfTheTime) {
  const Peer silent(Silent());
  const DoctorRun run = RunBriefly(silent.Url());
  ExpectFailure(run, "tls", "tls-timed-out", 3, "certificate");
}

TEST(DoctorTlsTest, AServiceThatEndsConnectionsIsFound) {
  const Peer closing([](int) {});
  ExpectFailure(RunDoctor(closing.Url()), "tls", "tls-closed", 3, "certificate");
}

TEST(DoctorTlsTest, AServiceThatAcceptsOnlyOneConnectionIsFound) {
  // The connection of the TCP step stays in the queue, which has room for one.
  const ListeningSocket full(0);
  const DoctorRun run = RunBriefly(full.Url());
  ExpectFailure(run, "tls", "tls-no-connection", 3, "certificate");
}

TEST(DoctorTlsTest, AServiceWhoseTlsBreaksLaterIsFound) {
  constexpr int kProbesAndTheLibrary = 3;
  const Identity root = Tarnik::Testing::MakeCa("CA");
  const Identity server = Tarnik::Testing::MakeIdentity(
      {.dnsNames = {}, .addresses = {"127.0.0.1"}, .notAfter = 100L * 24 * 3600}, &root);
  const TemporaryFile ca(root.Pem());
  // A fatal alert (RFC 8446, section 6): internal_error.
  const auto broken = Answering(std::string("\x15\x03\x03\x00\x02\x02\x50", 7));
  const auto whole = TlsPeer(server.Pem(), server.KeyPem());
  std::atomic<int> count = 0;
  const Peer peer(
      [&](int descriptor) { (++count <= kProbesAndTheLibrary ? whole : broken)(descriptor); });
  const DoctorRun run = RunDoctor(peer.Url(), {"--ca", ca.Path()});
  ExpectFailure(run, "http", "tls-broken", 3, "sts");
  EXPECT_THAT(run.Message("http"), HasSubstr("internal_error"));
}

TEST(DoctorTlsTest, AServiceThatNeverStopsSendingIsFound) {
  // A client ignores each HelloRequest (RFC 5246, section 7.4.1.1).
  const std::string request("\x16\x03\x03\x00\x04\x00\x00\x00\x00", 9);
  std::string requests;
  for (int i = 0; i < 1000; ++i) {
    requests += request;
  }
  const Peer flooding([requests](int descriptor) {
    while (send(descriptor, requests.data(), requests.size(), MSG_NOSIGNAL) > 0) {
    }
  });
  const DoctorRun run = RunDoctor(flooding.Url(), {"--timeout", "20"});
  ExpectFailure(run, "tls", "tls-refused", 3, "certificate");
  EXPECT_THAT(run.Message("tls"), HasSubstr("more than a handshake"));
}

TEST(DoctorTlsTest, VersionsBelowTls12AreFound) {
  DevSts::ServerOptions options;
  options.tls.protocol = DevSts::TlsProtocol::Tls11Only;
  const DevSts::Server sts(options);
  const DoctorRun run = RunDoctor(sts.HttpsUrl());
  ExpectFailure(run, "tls", "tls-too-old", 3, "certificate");
  EXPECT_THAT(run.Message("tls"), HasSubstr("TLSv1.1"));
}

TEST(DoctorTlsTest, WeakCipherSuitesAreFound) {
  DevSts::ServerOptions options;
  options.tls.protocol = DevSts::TlsProtocol::AnonymousSuites;
  const DevSts::Server sts(options);
  ExpectFailure(RunDoctor(sts.HttpsUrl()), "tls", "tls-weak-ciphers", 3, "certificate");
}

TEST(DoctorTlsTest, OtherRefusalsNameTheAlert) {
  // A fatal alert (RFC 8446, section 6): handshake_failure.
  const Peer refusing(Answering(std::string("\x15\x03\x03\x00\x02\x02\x28", 7)));
  const DoctorRun run = RunDoctor(refusing.Url());
  ExpectFailure(run, "tls", "tls-refused", 3, "certificate");
  EXPECT_EQ(run.Detail("tls", "/alert"), "\"handshake_failure\"");
}

TEST(DoctorTlsTest, ARequiredClientCertificateIsFoundInBothVersions) {
  for (const auto protocol : {DevSts::TlsProtocol::Modern, DevSts::TlsProtocol::Tls12Only}) {
    DevSts::ServerOptions options;
    options.tls.requireClientCertificate = true;
    options.tls.protocol = protocol;
    const DevSts::Server sts(options);
    const TemporaryFile ca(sts.CaCertificatePem());
    const DoctorRun run = RunDoctor(sts.HttpsUrl(), {"--ca", ca.Path()});
    // TLS 1.3 ends the handshake of the client before the service has seen its certificate.
    const bool isModern = protocol == DevSts::TlsProtocol::Modern;
    ExpectFailure(run, isModern ? "http" : "tls", "client-certificate-required", 3, "sts");
  }
}

TEST(DoctorTlsTest, ProtocolAndCipherAreShown) {
  const DevSts::Server sts;
  const DoctorRun run = RunDoctor(sts.HttpsUrl());
  EXPECT_EQ(run.Outcome("tls"), "ok");
  EXPECT_EQ(run.Detail("tls", "/protocol"), "\"TLSv1.3\"");
  EXPECT_THAT(run.Detail("tls", "/cipher"), HasSubstr("TLS_"));
}

}  // namespace
}  // namespace SsoClient::Tool::Testing
