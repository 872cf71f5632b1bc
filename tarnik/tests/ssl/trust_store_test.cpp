#include "ssl/trust_store.h"

#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "ssl/tls_fixture.h"
#include "support/ca_folder.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"
#include "support/thrown_message.h"
#include "support/tls_peer.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;

std::string Handshake(const SSLContextConfig& config, const TlsPeerOptions& peer) {
  TlsServer server(peer, 1);
  return TlsClient(*CreateSSLContext(config), server.Port()).Message();
}

TlsPeerOptions LeafPeer() {
  TlsPeerOptions peer;
  peer.identity = &TestPki::Get().leaf;
  return peer;
}

std::string MessageOf(const SSLContextConfig& config) {
  return ThrownMessage<SSLException>([&config] { CreateSSLContext(config); }, "");
}

TEST(TrustStoreTest, TrustsNoPeerByDefault) {
  EXPECT_EQ(Handshake({}, LeafPeer()),
            "TLS handshake with sts.example:PORT failed: unable to get local issuer certificate "
            "(CN=sts.example, issued by CN=Root)");
}

TEST(TrustStoreTest, RefusesASelfSignedPeer) {
  const Identity selfSigned = MakeIdentity({}, nullptr);
  TlsPeerOptions peer;
  peer.identity = &selfSigned;
  const SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  EXPECT_EQ(Handshake(config, peer),
            "TLS handshake with sts.example:PORT failed: self-signed certificate (CN=sts.example)");
}

TEST(TrustStoreTest, DoesNotTrustARootSentByThePeer) {
  const Identity stranger = MakeCa("Stranger");
  const Identity leaf = MakeIdentity({}, &stranger);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.chain = {&stranger};
  const SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  EXPECT_EQ(
      Handshake(config, peer),
      "TLS handshake with sts.example:PORT failed: self-signed certificate in certificate chain "
      "(CN=Stranger)");
}

TEST(TrustStoreTest, RefusesAForgedRootOfTheSameName) {
  const Identity forged = MakeCa("Root");
  const Identity leaf = MakeIdentity({}, &forged);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  const SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  EXPECT_NE(Handshake(config, peer), "");
}

TEST(TrustStoreTest, NeedsTheIntermediateCertificateFromThePeer) {
  const Identity leaf = MakeIdentity({}, &TestPki::Get().intermediate);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  const SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  EXPECT_EQ(Handshake(config, peer),
            "TLS handshake with sts.example:PORT failed: unable to get local issuer certificate "
            "(CN=sts.example, issued by CN=Intermediate)");
  peer.chain = {&TestPki::Get().intermediate};
  EXPECT_EQ(Handshake(config, peer), "");
}

TEST(TrustStoreTest, RefusesALeafAsIssuer) {
  const Identity leaf = MakeIdentity({}, &TestPki::Get().leaf);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.chain = {&TestPki::Get().leaf};
  const SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  EXPECT_THAT(
      Handshake(config, peer),
      testing::StartsWith("TLS handshake with sts.example:PORT failed: invalid CA certificate"));
}

TEST(TrustStoreTest, LoadsCaFiles) {
  const TemporaryFile other(MakeCa("Other").Pem());
  const TemporaryFile both(MakeCa("Third").Pem() + TestPki::Get().root.Pem());
  SSLContextConfig config;
  config.caFiles = {other.Path(), both.Path()};
  EXPECT_EQ(Handshake(config, LeafPeer()), "");
}

TEST(TrustStoreTest, LoadsCaFoldersByHash) {
  const CaFolder folder;
  folder.Add(TestPki::Get().root, 0);
  SSLContextConfig config;
  config.caFolders = {folder.Path()};
  EXPECT_EQ(Handshake(config, LeafPeer()), "");
}

TEST(TrustStoreTest, LooksThroughAllFoldersAndAllFilesOfAName) {
  const CaFolder folder;
  const CaFolder empty;
  // Another CA of the same name comes first.
  folder.Add(MakeCa("Root"), 0);
  folder.Add(TestPki::Get().root, 1);
  SSLContextConfig config;
  config.caFolders = {empty.Path(), folder.Path()};
  EXPECT_EQ(Handshake(config, LeafPeer()), "");
  config.caFolders = {empty.Path()};
  EXPECT_THAT(Handshake(config, LeafPeer()), testing::HasSubstr("unable to get local issuer"));
}

TEST(TrustStoreTest, FindsACertificateThatWasAddedToAFolderLater) {
  const CaFolder folder;
  SSLContextConfig config;
  config.caFolders = {folder.Path()};
  const auto context = CreateSSLContext(config);
  folder.Add(TestPki::Get().root, 0);
  TlsServer server(LeafPeer(), 1);
  EXPECT_EQ(TlsClient(*context, server.Port()).Message(), "");
}

TEST(TrustStoreTest, LoadsTheSystemStore) {
  SSLContextConfig config;
  config.useSystemStore = true;
  EXPECT_EQ(MessageOf(config), "");
  EXPECT_THAT(Handshake(config, LeafPeer()), testing::HasSubstr("unable to get local issuer"));
}

TEST(TrustStoreTest, NamesWhatItCannotLoad) {
  const TemporaryFile garbage("no certificate\n");
  SSLContextConfig config;
  config.caFiles = {"/nonexistent/ca.pem"};
  EXPECT_EQ(MessageOf(config),
            "Cannot load CA certificates from '/nonexistent/ca.pem': No such file or directory.");
  config.caFiles = {garbage.Path()};
  EXPECT_THAT(MessageOf(config),
              testing::StartsWith("Cannot load CA certificates from '" + garbage.Path() + "': "));
  config.caFiles = {""};
  EXPECT_EQ(MessageOf(config),
            "Cannot load CA certificates from '': the path is empty or holds a NUL.");
  config.caFiles = {};
  config.caFolders = {"/nonexistent"};
  EXPECT_EQ(MessageOf(config),
            "Cannot load CA certificates from the folder '/nonexistent': No such file or "
            "directory.");
  config.caFolders = {garbage.Path()};
  EXPECT_NE(MessageOf(config), "");
  config.caFolders = {};
  config.crlFiles = {"/nonexistent/crl.pem"};
  EXPECT_EQ(MessageOf(config),
            "Cannot load revocation lists from '/nonexistent/crl.pem': No such file or "
            "directory.");
  config.crlFiles = {garbage.Path()};
  EXPECT_THAT(MessageOf(config),
              testing::StartsWith("Cannot load revocation lists from '" + garbage.Path() + "': "));
}

TEST(TrustStoreTest, SaysThatAFileIsDer) {
  const auto certificate = TestPki::Get().root.ToCertificate();
  const TemporaryFile der(std::string(reinterpret_cast<const char*>(certificate->DerBytes()),
                                      certificate->DerLength()));
  SSLContextConfig config;
  config.caFiles = {der.Path()};
  EXPECT_EQ(MessageOf(config),
            "Cannot load CA certificates from '" + der.Path() + "': it is DER; PEM is expected.");
  config.caFiles = {};
  config.crlFiles = {der.Path()};
  EXPECT_EQ(MessageOf(config),
            "Cannot load revocation lists from '" + der.Path() + "': it is DER; PEM is expected.");
}

TEST(TrustStoreTest, RefusesNullCertificates) {
  SSLContextConfig config;
  config.caCertificates = {nullptr};
  EXPECT_THROW(CreateSSLContext(config), InvalidArgumentException);
  config.caCertificates = {};
  config.pinnedCertificates = {nullptr};
  EXPECT_THROW(CreateSSLContext(config), InvalidArgumentException);
}

}  // namespace
}  // namespace Tarnik::Testing
