#include <gmock/gmock.h>

#include "integration/sts_fixture.h"

namespace SsoClient::Testing {
namespace {

using DevSts::ServerCertificate;
using DevSts::TlsProtocol;
using testing::HasSubstr;

struct PeerCase {
  const char* name;
  DevSts::TlsOptions tls;
  const char* urlHost;
  const char* reason;  ///< part of the message; null if the token is acquired
};

DevSts::TlsOptions With(ServerCertificate certificate) {
  DevSts::TlsOptions options;
  options.certificate = certificate;
  return options;
}

DevSts::TlsOptions With(TlsProtocol protocol) {
  DevSts::TlsOptions options;
  options.protocol = protocol;
  return options;
}

class TlsPeerTest : public testing::TestWithParam<PeerCase> {};

TEST_P(TlsPeerTest, IsAcceptedOrRefusedWithItsReason) {
  DevSts::ServerOptions options;
  options.tls = GetParam().tls;
  const DevSts::Server server(options);
  const auto service = MakeService(server, server.HttpsUrlFor(GetParam().urlHost));
  const auto acquire = [&] { return service->AcquireToken(kUser, kPassword, TenMinutes()); };
  if (GetParam().reason == nullptr) {
    EXPECT_NE(acquire(), nullptr);
    return;
  }
  EXPECT_THAT(MessageOf<CommunicationException>(acquire), HasSubstr(GetParam().reason));
  EXPECT_TRUE(server.Requests().empty());
}

INSTANTIATE_TEST_SUITE_P(
    Peers, TlsPeerTest,
    testing::Values(
        PeerCase{"Valid", With(ServerCertificate::Valid), "localhost", nullptr},
        PeerCase{"ValidByAddress", With(ServerCertificate::Valid), "127.0.0.1", nullptr},
        PeerCase{"ThroughIntermediate", With(ServerCertificate::ThroughIntermediate), "localhost",
                 nullptr},
        PeerCase{"Tls12", With(TlsProtocol::Tls12Only), "localhost", nullptr},
        PeerCase{"MissingIntermediate", With(ServerCertificate::MissingIntermediate), "localhost",
                 "issuer"},
        PeerCase{"Expired", With(ServerCertificate::Expired), "localhost", "expired"},
        PeerCase{"NotYetValid", With(ServerCertificate::NotYetValid), "localhost", "not yet valid"},
        PeerCase{"SelfSigned", With(ServerCertificate::SelfSigned), "localhost", "self-signed"},
        PeerCase{"WrongHost", With(ServerCertificate::WrongHost), "localhost", "localhost"},
        PeerCase{"NameOnlyInCommonName", With(ServerCertificate::NameOnlyInCommonName), "localhost",
                 "localhost"},
        PeerCase{"AddressAsDnsName", With(ServerCertificate::AddressAsDnsName), "127.0.0.1",
                 "127.0.0.1"},
        PeerCase{"NulInName", With(ServerCertificate::NulInName), "localhost", "localhost"},
        PeerCase{"Tls11", With(TlsProtocol::Tls11Only), "localhost", "handshake"},
        PeerCase{"AnonymousSuites", With(TlsProtocol::AnonymousSuites), "localhost", "handshake"}),
    [](const auto& tested) { return tested.param.name; });

TEST(TlsTrustTest, AnotherCaIsNotTrusted) {
  const DevSts::Server server;
  DevSts::CertificateSpec spec;
  spec.commonName = "Another CA";
  spec.isAuthority = true;
  Tarnik::Ssl::SSLContextConfig trust;
  trust.caCertificates =
      Tarnik::Crypto::CreateCertificatesFromPem(DevSts::MakeCertificate(spec).certificatePem);
  const auto sslContext = Tarnik::Ssl::CreateSSLContext(trust);
  SecurityTokenServiceConfig config;
  config.url = server.HttpsUrl();
  config.sslContext = sslContext.get();
  config.tokenFactory = CreateSamlTokenFactory(TrustSigner(server.SigningCertificatePem()).get());
  const auto service = CreateSecurityTokenService(config);
  MessageOf<CommunicationException>([&] { service->AcquireToken(kUser, kPassword, TenMinutes()); });
  EXPECT_TRUE(server.Requests().empty());
}

TEST(TlsTrustTest, SessionsAreResumedOnOneContext) {
  const DevSts::Server server;
  const auto service = MakeService(server, server.HttpsUrl());
  service->AcquireToken(kUser, kPassword, TenMinutes());
  service->AcquireToken(kUser, kPassword, TenMinutes());
  EXPECT_FALSE(server.Requests().front().tlsSessionReused);
  EXPECT_TRUE(server.Requests().back().tlsSessionReused);
}

}  // namespace
}  // namespace SsoClient::Testing
