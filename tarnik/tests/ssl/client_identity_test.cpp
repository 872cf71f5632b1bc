#include "ssl/client_identity.h"

#include <gtest/gtest.h>
#include <tarnik/core/exception.h>
#include <tarnik/core/object_impl.h>

#include <string>

#include "ssl/tls_fixture.h"
#include "support/key_texts.h"

namespace Tarnik::Ssl {
namespace {

using Testing::Identity;
using Testing::IdentityOptions;
using Testing::MakeCa;
using Testing::MakeIdentity;
using Testing::TestPki;
using Testing::TlsClient;
using Testing::TlsPeerOptions;
using Testing::TlsServer;

Ref<const Crypto::PrivateKey> KeyOf(const Identity& identity) {
  return Crypto::CreatePrivateKeyFromPem(Tests::ToPkcs8Pem(identity.key.get()));
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

SSLContextConfig Trusting() {
  SSLContextConfig config;
  config.caCertificates = {TestPki::Get().root.ToCertificate()};
  return config;
}

SSLContextConfig ShowingClient() {
  SSLContextConfig config = Trusting();
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
  try {
    CreateSSLContext(config);
  } catch (const SSLException& error) {
    return error.Message();
  }
  return "made";
}

class ClientIdentity : public testing::TestWithParam<int> {
 protected:
  ClientIdentity() {
    peer_.identity = &TestPki::Get().leaf;
    peer_.minVersion = peer_.maxVersion = GetParam();
    peer_.clientCa = &TestPki::Get().root;
  }

  /// The first error of a handshake and of reading what the server says, or that.
  static std::string Exchange(SSLContext& context, int port) {
    const TlsClient client(context, port);
    if (!client.Message().empty()) {
      EXPECT_TRUE(client.Handshake().IsError<SSLException>());
      return client.Message();
    }
    std::string error;
    const std::string said = Testing::ReadAll(client.Stream(), 100, &error);
    return error.empty() ? said : error;
  }

  TlsPeerOptions peer_;
};

TEST_P(ClientIdentity, IsShownToAPeerThatDemandsIt) {
  TlsServer server(peer_, 1);
  EXPECT_EQ(Exchange(*CreateSSLContext(ShowingClient()), server.Port()), "hello");
  EXPECT_EQ(server.Join()[0].clientCertificate, DerOf(Client()));
}

TEST_P(ClientIdentity, IsMissedByAPeerThatDemandsIt) {
  TlsServer server(peer_, 1);
  EXPECT_EQ(Exchange(*CreateSSLContext(Trusting()), server.Port()),
            GetParam() == TLS1_2_VERSION
                ? "TLS handshake with sts.example failed: sslv3 alert handshake failure"
                : "Cannot read from the TLS connection with sts.example: tlsv13 alert certificate "
                  "required");
  EXPECT_FALSE(server.Join()[0].accepted);
}

// The twin of the first: the peer finds the issuer in what is sent, not elsewhere.
TEST_P(ClientIdentity, IsNotBelievedWithoutItsChain) {
  TlsServer server(peer_, 1);
  SSLContextConfig config = ShowingClient();
  config.clientCertificateChain.clear();
  // Trusted by the client, and yet not sent.
  config.caCertificates.push_back(TestPki::Get().intermediate.ToCertificate());
  EXPECT_NE(Exchange(*CreateSSLContext(config), server.Port()), "hello");
  EXPECT_FALSE(server.Join()[0].accepted);
}

TEST_P(ClientIdentity, IsNotShownToAPeerThatDoesNotAsk) {
  peer_.clientCa = nullptr;
  TlsServer server(peer_, 1);
  EXPECT_EQ(Exchange(*CreateSSLContext(ShowingClient()), server.Port()), "hello");
  EXPECT_EQ(server.Join()[0].clientCertificate, "");
}

TEST_P(ClientIdentity, StaysWithItsContextWhenSessionsAreResumed) {
  TlsServer server(peer_, 3);
  const auto context = CreateSSLContext(ShowingClient());
  EXPECT_EQ(Exchange(*context, server.Port()), "hello");
  EXPECT_EQ(Exchange(*context, server.Port()), "hello");
  EXPECT_NE(Exchange(*CreateSSLContext(Trusting()), server.Port()), "hello");
  EXPECT_FALSE(server.Join()[0].resumed);
  EXPECT_TRUE(server.Join()[1].resumed);
  EXPECT_FALSE(server.Join()[2].resumed);
  EXPECT_FALSE(server.Join()[2].accepted);
}

INSTANTIATE_TEST_SUITE_P(Versions, ClientIdentity, testing::Values(TLS1_2_VERSION, TLS1_3_VERSION),
                         Testing::NameOfVersion);

TEST(ClientIdentityConfig, IsRefusedInHalves) {
  SSLContextConfig keyless = ShowingClient();
  keyless.clientPrivateKey = nullptr;
  EXPECT_EQ(RefusalOf(keyless),
            "The SSL context has a client certificate without the private key that belongs to it.");
  SSLContextConfig bare = ShowingClient();
  bare.clientCertificate = nullptr;
  EXPECT_EQ(
      RefusalOf(bare),
      "The SSL context has a client's private key without the certificate that belongs to it.");
  SSLContextConfig chainAlone = ShowingClient();
  chainAlone.clientPrivateKey = nullptr;
  chainAlone.clientCertificate = nullptr;
  EXPECT_EQ(RefusalOf(chainAlone),
            "The SSL context has a client's chain without a client certificate.");
}

TEST(ClientIdentityConfig, IsRefusedWhenKeyAndCertificateAreStrangers) {
  SSLContextConfig config = ShowingClient();
  config.clientPrivateKey = KeyOf(TestPki::Get().leaf);
  EXPECT_EQ(RefusalOf(config),
            "The client's private key does not belong to the client certificate CN=client.");
}

TEST(ClientIdentityConfig, IsRefusedWithANullInItsChain) {
  SSLContextConfig config = ShowingClient();
  config.clientCertificateChain.push_back(nullptr);
  EXPECT_THROW(CreateSSLContext(config), InvalidArgumentException);
}

TEST(ClientIdentityConfig, IsRefusedWhenTlsFindsItTooWeak) {
  const OpenSsl::OwnedKey weak = Tests::MakeRsaKey(1024);
  Tests::CertificateRecipe recipe;
  recipe.key = weak.get();
  SSLContextConfig config;
  config.clientCertificate = Tests::MakeCertificate(recipe);
  config.clientPrivateKey = Crypto::CreatePrivateKeyFromPem(Tests::ToPkcs8Pem(weak.get()));
  EXPECT_EQ(RefusalOf(config),
            "Cannot use the client certificate CN=signer,O=Test\\, Inc.: ee key too small.");
}

class StrangeKey final : public Crypto::PrivateKey, public ObjectImpl {
 public:
  Ref<const Crypto::PublicKey> GetPublicKey() const override { return nullptr; }
  bool Matches(const Crypto::Certificate&) const override { return true; }
};

TEST(ClientIdentityConfig, IsRefusedWithAKeyOfAnotherMake) {
  SSLContextConfig config = ShowingClient();
  config.clientPrivateKey = MakeRef<StrangeKey>();
  EXPECT_EQ(RefusalOf(config), "The client's private key was not made by this library.");
}

}  // namespace
}  // namespace Tarnik::Ssl
