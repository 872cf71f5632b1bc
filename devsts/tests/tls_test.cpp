#include <memory>
#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <openssl/x509_vfy.h>

#include "devsts/server.h"
#include "raw_client.h"
#include "request_text.h"

namespace DevSts::Testing {
namespace {

using testing::StartsWith;

struct CertificateCase {
  const char* name;
  ServerCertificate certificate;
  const char* host;
  long verdict;
};

class ServerCertificateTest : public testing::TestWithParam<CertificateCase> {};

TEST_P(ServerCertificateTest, HasTheExpectedOpenSslResult) {
  ServerOptions options;
  options.tls.certificate = GetParam().certificate;
  options.tls.dnsNames = {"*.example.com"};
  const Server server(options);
  RawClient client(server.HttpsPort());
  EXPECT_EQ(client.StartTls(server.CaCertificatePem(), nullptr, GetParam().host),
            GetParam().verdict);
}

INSTANTIATE_TEST_SUITE_P(
    EveryKind, ServerCertificateTest,
    testing::Values(
        CertificateCase{"ValidByAddress", ServerCertificate::Valid, "127.0.0.1", X509_V_OK},
        CertificateCase{"ValidByName", ServerCertificate::Valid, "localhost", X509_V_OK},
        CertificateCase{"ThroughIntermediate", ServerCertificate::ThroughIntermediate, "127.0.0.1",
                        X509_V_OK},
        CertificateCase{"MissingIntermediate", ServerCertificate::MissingIntermediate, "127.0.0.1",
                        X509_V_ERR_UNABLE_TO_GET_ISSUER_CERT_LOCALLY},
        CertificateCase{"Expired", ServerCertificate::Expired, "127.0.0.1",
                        X509_V_ERR_CERT_HAS_EXPIRED},
        CertificateCase{"NotYetValid", ServerCertificate::NotYetValid, "127.0.0.1",
                        X509_V_ERR_CERT_NOT_YET_VALID},
        CertificateCase{"SelfSigned", ServerCertificate::SelfSigned, "127.0.0.1",
                        X509_V_ERR_DEPTH_ZERO_SELF_SIGNED_CERT},
        CertificateCase{"WrongHost", ServerCertificate::WrongHost, "localhost",
                        X509_V_ERR_HOSTNAME_MISMATCH},
        CertificateCase{"NameOnlyInCommonName", ServerCertificate::NameOnlyInCommonName,
                        "localhost", X509_V_ERR_HOSTNAME_MISMATCH},
        CertificateCase{"AddressAsDnsName", ServerCertificate::AddressAsDnsName, "127.0.0.1",
                        X509_V_ERR_IP_ADDRESS_MISMATCH},
        CertificateCase{"NulInName", ServerCertificate::NulInName, "localhost",
                        X509_V_ERR_HOSTNAME_MISMATCH},
        CertificateCase{"WildcardThatMatches", ServerCertificate::Custom, "sts.example.com",
                        X509_V_OK},
        CertificateCase{"WildcardOfOneLabelOnly", ServerCertificate::Custom, "a.sts.example.com",
                        X509_V_ERR_HOSTNAME_MISMATCH}),
    [](const auto& test) { return test.param.name; });

TEST(TlsTest, AnotherServersAuthorityIsNotTrusted) {
  const Server server;
  const Server other;
  RawClient client(server.HttpsPort());
  EXPECT_NE(client.StartTls(other.CaCertificatePem()), X509_V_OK);
}

TEST(TlsTest, RefusesModernClientsOverOldProtocols) {
  for (const TlsProtocol protocol : {TlsProtocol::Tls11Only, TlsProtocol::AnonymousSuites}) {
    ServerOptions options;
    options.tls.protocol = protocol;
    const Server server(options);
    RawClient client(server.HttpsPort());
    EXPECT_EQ(client.StartTls(server.CaCertificatePem()), -1);
    EXPECT_TRUE(
        server.WaitUntil([](const Counters& counters) { return counters.handshakesFailed == 1; }));
  }
}

// The handshake of a client that accepts everything. The server must support it, or the refusals
// would prove nothing.
bool CarelessHandshake(const Server& server, int version, const char* ciphers) {
  const std::shared_ptr<SSL_CTX> context(SSL_CTX_new(TLS_client_method()), SSL_CTX_free);
  SSL_CTX_set_min_proto_version(context.get(), version);
  SSL_CTX_set_max_proto_version(context.get(), version);
  SSL_CTX_set_cipher_list(context.get(), ciphers);
  const std::shared_ptr<BIO> bio(BIO_new_ssl_connect(context.get()), BIO_free_all);
  const std::string target = "127.0.0.1:" + std::to_string(server.HttpsPort());
  BIO_set_conn_hostname(bio.get(), target.c_str());
  return BIO_do_handshake(bio.get()) == 1;
}

TEST(TlsTest, SpeaksOldProtocolsToCarelessClients) {
  ServerOptions options;
  options.tls.protocol = TlsProtocol::Tls11Only;
  const Server old(options);
  EXPECT_TRUE(CarelessHandshake(old, TLS1_1_VERSION, "ALL:@SECLEVEL=0"));
  options.tls.protocol = TlsProtocol::AnonymousSuites;
  const Server anonymous(options);
  EXPECT_TRUE(CarelessHandshake(anonymous, TLS1_2_VERSION, "aNULL:@SECLEVEL=0"));
}

std::string Ask(RawClient& client) {
  client.Send(PostOf(AliceEnvelope(), kIssueAction));
  return client.ReadAnswer();
}

TEST(TlsTest, RequiresAClientCertificate) {
  ServerOptions options;
  options.tls.requireClientCertificate = true;
  const Server server(options);
  RawClient anonymous(server.HttpsPort());
  anonymous.StartTls(server.CaCertificatePem());
  EXPECT_TRUE(
      server.WaitUntil([](const Counters& counters) { return counters.handshakesFailed == 1; }));

  const Credential credential = server.MakeClientCredential("client one");
  RawClient identified(server.HttpsPort());
  identified.UseClientCredential(credential.certificatePem, credential.privateKeyPem);
  ASSERT_EQ(identified.StartTls(server.CaCertificatePem()), X509_V_OK);
  EXPECT_THAT(Ask(identified), StartsWith("HTTP/1.1 200 "));
  EXPECT_EQ(server.LastRequest().peerCertificatePem, credential.certificatePem);
}

bool ResumesOnSecondConnection(const Server& server) {
  RawClient first(server.HttpsPort());
  EXPECT_EQ(first.StartTls(server.CaCertificatePem(), nullptr, "localhost"), X509_V_OK);
  EXPECT_THAT(Ask(first), StartsWith("HTTP/1.1 200 "));
  EXPECT_FALSE(server.LastRequest().tlsSessionReused);
  const std::shared_ptr<SSL_SESSION> session(SSL_get1_session(first.Tls()), SSL_SESSION_free);
  RawClient second(server.HttpsPort());
  EXPECT_EQ(second.StartTls(server.CaCertificatePem(), session.get(), "localhost"), X509_V_OK);
  EXPECT_THAT(Ask(second), StartsWith("HTTP/1.1 200 "));
  EXPECT_EQ(server.LastRequest().serverName, "localhost");
  EXPECT_TRUE(server.LastRequest().overTls);
  return server.LastRequest().tlsSessionReused;
}

TEST(TlsTest, ResumesSessions) {
  for (const TlsProtocol protocol : {TlsProtocol::Modern, TlsProtocol::Tls12Only}) {
    ServerOptions options;
    options.tls.protocol = protocol;
    const Server server(options);
    EXPECT_TRUE(ResumesOnSecondConnection(server));
    EXPECT_EQ(server.GetCounters().handshakesResumed, 1U);
    EXPECT_EQ(server.LastRequest().tlsVersion,
              protocol == TlsProtocol::Modern ? "TLSv1.3" : "TLSv1.2");
  }
}

TEST(TlsTest, DoesNotResumeSessionsIfDisabled) {
  ServerOptions options;
  options.tls.sessionResumption = false;
  const Server server(options);
  EXPECT_FALSE(ResumesOnSecondConnection(server));
}

}  // namespace
}  // namespace DevSts::Testing
