#include <string>
#include <utility>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>

#include "ssl/tls_fixture.h"
#include "support/outcome.h"
#include "support/test_pki.h"
#include "support/tls_peer.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;

std::string HandshakeWithLeaf(TlsPeerOptions peer) {
  if (peer.ciphers != "aNULL") {
    peer.identity = &TestPki::Get().leaf;
  }
  TlsServer server(peer, 1);
  return TlsClient(*TrustingContext(TestPki::Get().root), server.Port()).Message();
}

TEST(SSLContextTest, SupportsTls12AndTls13) {
  for (const int version : {TLS1_2_VERSION, TLS1_3_VERSION}) {
    TlsPeerOptions peer;
    peer.minVersion = peer.maxVersion = version;
    EXPECT_EQ(HandshakeWithLeaf(peer), "");
  }
}

TEST(SSLContextTest, RefusesAPeerOfAnOlderProtocol) {
  TlsPeerOptions peer;
  peer.minVersion = TLS1_VERSION;
  peer.maxVersion = TLS1_1_VERSION;
  peer.ciphers = "ALL";
  peer.securityLevel = 0;
  EXPECT_EQ(HandshakeWithLeaf(peer), "TLS handshake with sts.example:PORT failed: " +
                                         SentAlert("protocol_version", SSL_AD_PROTOCOL_VERSION));
}

struct CipherCase {
  const char* ciphers;
  std::string message;
};

TEST(SSLContextTest, OffersNoWeakSuites) {
  const std::string refusal = "TLS handshake with sts.example:PORT failed: " +
                              SentAlert("handshake_failure", SSL_AD_HANDSHAKE_FAILURE);
  for (const CipherCase& suite : {CipherCase{"aNULL", refusal}, CipherCase{"eNULL", refusal},
                                  CipherCase{"ECDHE-ECDSA-AES128-GCM-SHA256", ""}}) {
    TlsPeerOptions peer;
    peer.maxVersion = TLS1_2_VERSION;
    peer.ciphers = suite.ciphers;
    peer.securityLevel = 0;
    EXPECT_EQ(HandshakeWithLeaf(peer), suite.message) << suite.ciphers;
  }
}

// NIST SP 800-57 part 1, section 5.6.1: RSA with 1024 bits has a strength of 80 bits; 112 are
// required.
TEST(SSLContextTest, RefusesAPeerWithAShortKey) {
  for (const auto& [bits, message] :
       {std::pair{1024U,
                  "TLS handshake with sts.example:PORT failed: EE certificate key too weak "
                  "(CN=sts.example)"},
        std::pair{2048U, ""}}) {
    IdentityOptions options;
    options.rsaBits = bits;
    const auto leaf = MakeIdentity(options, &TestPki::Get().root);
    TlsPeerOptions peer;
    peer.identity = &leaf;
    peer.securityLevel = 0;
    TlsServer server(peer, 1);
    EXPECT_EQ(TlsClient(*TrustingContext(TestPki::Get().root), server.Port()).Message(), message);
  }
}

class SSLContextResumptionTest : public testing::TestWithParam<int> {
 protected:
  SSLContextResumptionTest() {
    IdentityOptions options;
    options.dnsNames = {"sts.example", "other.example"};
    options.addresses = {"127.0.0.1"};
    leaf_ = MakeIdentity(options, &TestPki::Get().root);
    peer_.identity = &leaf_;
    peer_.minVersion = peer_.maxVersion = GetParam();
  }

  static void Exchange(SSLContext& context, int port, const std::string& host,
                       const std::string& serverName = "") {
    const TlsClient client(context, port, host, serverName);
    ASSERT_EQ(client.Message(), "");
    std::string error;
    EXPECT_EQ(ReadAll(client.Stream(), 100, &error), "hello");
    EXPECT_EQ(error, "");
  }

  Identity leaf_;
  TlsPeerOptions peer_;
};

TEST_P(SSLContextResumptionTest, ResumesASessionWithTheSamePeer) {
  TlsServer server(peer_, 3);
  const auto context = TrustingContext(TestPki::Get().root);
  Exchange(*context, server.Port(), "sts.example");
  Exchange(*context, server.Port(), "sts.example");
  Exchange(*context, server.Port(), "STS.example");
  EXPECT_FALSE(server.Join()[0].resumed);
  EXPECT_TRUE(server.Join()[1].resumed);
  EXPECT_TRUE(server.Join()[2].resumed);
}

TEST_P(SSLContextResumptionTest, DoesNotResumeASessionWithAnotherPeer) {
  TlsServer server(peer_, 4);
  const auto context = TrustingContext(TestPki::Get().root);
  Exchange(*context, server.Port(), "sts.example");
  Exchange(*context, server.Port(), "other.example");
  Exchange(*context, server.Port(), "sts.example", "other.example");
  Exchange(*context, server.Port(), "127.0.0.1", "sts.example");
  for (const auto& connection : server.Join()) {
    EXPECT_FALSE(connection.resumed);
  }
}

TEST_P(SSLContextResumptionTest, DoesNotResumeASessionOfAnotherContext) {
  TlsServer server(peer_, 2);
  Exchange(*TrustingContext(TestPki::Get().root), server.Port(), "sts.example");
  Exchange(*TrustingContext(TestPki::Get().root), server.Port(), "sts.example");
  EXPECT_FALSE(server.Join()[1].resumed);
}

TEST_P(SSLContextResumptionTest, KeepsNoSessionOfAPeerThatItRefuses) {
  TlsServer server(peer_, 2);
  const auto context = TrustingContext(MakeCa("Stranger"));
  for (int i = 0; i < 2; ++i) {
    EXPECT_NE(TlsClient(*context, server.Port()).Message(), "");
  }
  EXPECT_FALSE(server.Join()[1].resumed);
}

INSTANTIATE_TEST_SUITE_P(Versions, SSLContextResumptionTest,
                         testing::Values(TLS1_2_VERSION, TLS1_3_VERSION), NameOfVersion);

TEST(SSLContextTest, RefusesToWrapANullStream) {
  const auto context = CreateSSLContext({});
  EXPECT_THROW(context->WrapStream(nullptr, ""), InvalidArgumentException);
  EXPECT_EQ(context->ToString(), "<SSLContext>");
}

}  // namespace
}  // namespace Tarnik::Testing
