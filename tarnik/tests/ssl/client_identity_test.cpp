#include "ssl/client_identity.h"

#include <string>

#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>
#include <tarnik/crypto/private_key.h>
#include <tarnik/crypto/public_key.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "ssl/tls_fixture.h"
#include "support/key_texts.h"
#include "support/openssl.h"
#include "support/outcome.h"
#include "support/test_certificates.h"
#include "support/test_pki.h"
#include "support/thrown_message.h"
#include "support/tls_peer.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;

Ref<const Crypto::PrivateKey> KeyOf(const Identity& identity) {
  return Crypto::CreatePrivateKeyFromPem(ToPkcs8Pem(identity.key.get()));
}

Identity MakeClient(const Identity& issuer) {
  IdentityOptions options;
  options.commonName = "client";
  options.dnsNames = {};
  options.extendedKeyUsage = "clientAuth";
  return MakeIdentity(options, &issuer);
}

/// Issued by the intermediate CA, which is issued by the root CA.
const Identity& Client() {
  static const auto* const client = new Identity(MakeClient(TestPki::Get().intermediate));
  return *client;
}

SSLContextConfig SendingClient() {
  SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  config.clientCertificate = Client().ToCertificate();
  config.clientPrivateKey = KeyOf(Client());
  config.clientCertificateChain = {TestPki::Get().intermediate.ToCertificate()};
  return config;
}

std::string DerOf(const Identity& identity) {
  const auto certificate = identity.ToCertificate();
  return {reinterpret_cast<const char*>(certificate->DerBytes()), certificate->DerLength()};
}

std::string RefusalOf(const SSLContextConfig& config) {
  return ThrownMessage<SSLException>([&config] { CreateSSLContext(config); }, "created");
}

class ClientIdentityTest : public testing::TestWithParam<int> {
 protected:
  ClientIdentityTest() {
    peer_.identity = &TestPki::Get().leaf;
    peer_.minVersion = peer_.maxVersion = GetParam();
    peer_.clientCa = &TestPki::Get().root;
  }

  /// What the server sends after the handshake, or the first error of the handshake or the read.
  static std::string Exchange(SSLContext& context, int port) {
    const TlsClient client(context, port);
    if (!client.Message().empty()) {
      EXPECT_TRUE(client.Handshake().IsError<SSLException>());
      return client.Message();
    }
    std::string error;
    const std::string received = ReadAll(client.Stream(), 100, &error);
    return error.empty() ? received : client.WithoutPort(error);
  }

  TlsPeerOptions peer_;
};

TEST_P(ClientIdentityTest, IsSentToAPeerThatRequiresIt) {
  TlsServer server(peer_, 1);
  EXPECT_EQ(Exchange(*CreateSSLContext(SendingClient()), server.Port()), "hello");
  EXPECT_EQ(server.Join()[0].clientCertificate, DerOf(Client()));
}

TEST_P(ClientIdentityTest, IsReportedAsMissingByAPeerThatRequiresIt) {
  TlsServer server(peer_, 1);
  EXPECT_EQ(Exchange(*CreateSSLContext(TrustingConfig(TestPki::Get().root)), server.Port()),
            GetParam() == TLS1_2_VERSION
                ? "TLS handshake with sts.example:PORT failed: " +
                      SentAlert("handshake_failure", SSL_AD_HANDSHAKE_FAILURE)
                : "Cannot read from the TLS connection with sts.example:PORT: " +
                      SentAlert("certificate_required", SSL_AD_CERTIFICATE_REQUIRED));
  EXPECT_FALSE(server.Join()[0].accepted);
}

// The counterpart of the first test: the peer finds the issuer only in what is sent.
TEST_P(ClientIdentityTest, IsRefusedByThePeerWithoutItsChain) {
  TlsServer server(peer_, 1);
  SSLContextConfig config = SendingClient();
  config.clientCertificateChain.clear();
  // Trusted by the client, but not sent.
  config.caCertificates.push_back(TestPki::Get().intermediate.ToCertificate());
  EXPECT_NE(Exchange(*CreateSSLContext(config), server.Port()), "hello");
  EXPECT_FALSE(server.Join()[0].accepted);
}

TEST_P(ClientIdentityTest, IsNotSentToAPeerThatDoesNotAsk) {
  peer_.clientCa = nullptr;
  TlsServer server(peer_, 1);
  EXPECT_EQ(Exchange(*CreateSSLContext(SendingClient()), server.Port()), "hello");
  EXPECT_EQ(server.Join()[0].clientCertificate, "");
}

TEST_P(ClientIdentityTest, IsNotSharedWithAnotherContextByResumption) {
  TlsServer server(peer_, 3);
  const auto context = CreateSSLContext(SendingClient());
  EXPECT_EQ(Exchange(*context, server.Port()), "hello");
  EXPECT_EQ(Exchange(*context, server.Port()), "hello");
  EXPECT_NE(Exchange(*CreateSSLContext(TrustingConfig(TestPki::Get().root)), server.Port()),
            "hello");
  EXPECT_FALSE(server.Join()[0].resumed);
  EXPECT_TRUE(server.Join()[1].resumed);
  EXPECT_FALSE(server.Join()[2].resumed);
  EXPECT_FALSE(server.Join()[2].accepted);
}

INSTANTIATE_TEST_SUITE_P(Versions, ClientIdentityTest,
                         testing::Values(TLS1_2_VERSION, TLS1_3_VERSION), NameOfVersion);

TEST(ClientIdentityConfigTest, IsRefusedWhenIncomplete) {
  SSLContextConfig keyless = SendingClient();
  keyless.clientPrivateKey = nullptr;
  EXPECT_EQ(RefusalOf(keyless),
            "The SSL context has a client certificate without the private key that belongs to it.");
  SSLContextConfig bare = SendingClient();
  bare.clientCertificate = nullptr;
  EXPECT_EQ(
      RefusalOf(bare),
      "The SSL context has a client's private key without the certificate that belongs to it.");
  SSLContextConfig onlyChain = SendingClient();
  onlyChain.clientPrivateKey = nullptr;
  onlyChain.clientCertificate = nullptr;
  EXPECT_EQ(RefusalOf(onlyChain),
            "The SSL context has a client's chain without a client certificate.");
}

TEST(ClientIdentityConfigTest, IsRefusedWhenKeyAndCertificateDoNotMatch) {
  SSLContextConfig config = SendingClient();
  config.clientPrivateKey = KeyOf(TestPki::Get().leaf);
  EXPECT_EQ(RefusalOf(config),
            "The client's private key does not belong to the client certificate CN=client.");
}

TEST(ClientIdentityConfigTest, IsRefusedWithANullInItsChain) {
  SSLContextConfig config = SendingClient();
  config.clientCertificateChain.push_back(nullptr);
  EXPECT_THROW(CreateSSLContext(config), InvalidArgumentException);
}

TEST(ClientIdentityConfigTest, IsRefusedWhenItIsTooWeakForTls) {
  const OpenSsl::OwnedKey weak = MakeRsaKey(1024);
  CertificateRecipe recipe;
  recipe.key = weak.get();
  SSLContextConfig config;
  config.clientCertificate = MakeCertificate(recipe);
  config.clientPrivateKey = Crypto::CreatePrivateKeyFromPem(ToPkcs8Pem(weak.get()));
  EXPECT_EQ(RefusalOf(config),
            "Cannot use the client certificate CN=signer,O=Test\\, Inc.: ee key too small.");
}

class StrangeKey final : public Crypto::PrivateKey, public ObjectImpl {
 public:
  Ref<const Crypto::PublicKey> GetPublicKey() const override { return nullptr; }
  bool Matches(const Crypto::Certificate&) const override { return true; }
};

TEST(ClientIdentityConfigTest, IsRefusedWithAKeyOfAnotherImplementation) {
  SSLContextConfig config = SendingClient();
  config.clientPrivateKey = MakeRef<StrangeKey>();
  EXPECT_EQ(RefusalOf(config), "The client's private key was not made by this library.");
}

}  // namespace
}  // namespace Tarnik::Testing
