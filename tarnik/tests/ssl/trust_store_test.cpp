#include "ssl/trust_store.h"

#include <cstdio>
#include <cstdlib>
#include <memory>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <tarnik/core/exception.h>
#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "ssl/tls_fixture.h"
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
            "TLS handshake with sts.example failed: unable to get local issuer certificate "
            "(CN=sts.example, issued by CN=Root)");
}

TEST(TrustStoreTest, RefusesASelfSignedPeer) {
  const Identity selfSigned = MakeIdentity({}, nullptr);
  TlsPeerOptions peer;
  peer.identity = &selfSigned;
  const SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  EXPECT_EQ(Handshake(config, peer),
            "TLS handshake with sts.example failed: self-signed certificate (CN=sts.example)");
}

TEST(TrustStoreTest, DoesNotTrustARootSentByThePeer) {
  const Identity stranger = MakeCa("Stranger");
  const Identity leaf = MakeIdentity({}, &stranger);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.chain = {&stranger};
  const SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  EXPECT_EQ(Handshake(config, peer),
            "TLS handshake with sts.example failed: self-signed certificate in certificate chain "
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
            "TLS handshake with sts.example failed: unable to get local issuer certificate "
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
  EXPECT_THAT(Handshake(config, peer),
              testing::StartsWith("TLS handshake with sts.example failed: invalid CA certificate"));
}

TEST(TrustStoreTest, LoadsCaFiles) {
  const TemporaryFile other(MakeCa("Other").Pem());
  const TemporaryFile both(MakeCa("Third").Pem() + TestPki::Get().root.Pem());
  SSLContextConfig config;
  config.caFiles = {other.Path(), both.Path()};
  EXPECT_EQ(Handshake(config, LeafPeer()), "");
}

TEST(TrustStoreTest, LoadsCaFoldersByHash) {
  std::string folder = testing::TempDir() + "tarnik_XXXXXX";
  ASSERT_NE(mkdtemp(folder.data()), nullptr);
  char name[16];
  std::snprintf(name, sizeof(name), "/%08lx.0",
                X509_NAME_hash_ex(X509_get_subject_name(TestPki::Get().root.certificate.get()),
                                  nullptr, nullptr, nullptr));
  const std::string path = folder + name;
  const TemporaryFile root(TestPki::Get().root.Pem());
  ASSERT_EQ(symlink(root.Path().c_str(), path.c_str()), 0);
  SSLContextConfig config;
  config.caFolders = {folder};
  EXPECT_EQ(Handshake(config, LeafPeer()), "");
  unlink(path.c_str());
  rmdir(folder.c_str());
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

TEST(TrustStoreTest, RefusesNullCertificates) {
  SSLContextConfig config;
  config.caCertificates = {nullptr};
  EXPECT_THROW(CreateSSLContext(config), InvalidArgumentException);
  config.caCertificates = {};
  config.pinnedCertificates = {nullptr};
  EXPECT_THROW(CreateSSLContext(config), InvalidArgumentException);
}

std::string HandshakeWithCrls(const std::vector<std::string>& crls, const TlsPeerOptions& peer) {
  std::vector<std::unique_ptr<TemporaryFile>> files;
  SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  for (const std::string& crl : crls) {
    files.push_back(std::make_unique<TemporaryFile>(crl));
    config.crlFiles.push_back(files.back()->Path());
  }
  return Handshake(config, peer);
}

TEST(TrustStoreTest, RefusesARevokedPeer) {
  const Identity& root = TestPki::Get().root;
  const Identity& leaf = TestPki::Get().leaf;
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(root, nullptr)}, LeafPeer()), "");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(root, &leaf)}, LeafPeer()),
            "TLS handshake with sts.example failed: certificate revoked (CN=sts.example)");
}

TEST(TrustStoreTest, RefusesAPeerWhoseRevocationListIsMissingOrExpired) {
  const Identity stranger = MakeCa("Stranger");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(stranger, nullptr)}, LeafPeer()),
            "TLS handshake with sts.example failed: unable to get certificate CRL "
            "(CN=sts.example)");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(TestPki::Get().root, nullptr, -60)}, LeafPeer()),
            "TLS handshake with sts.example failed: CRL has expired (CN=sts.example)");
}

TEST(TrustStoreTest, ChecksTheWholeChainForRevocation) {
  const Identity& root = TestPki::Get().root;
  const Identity& intermediate = TestPki::Get().intermediate;
  const Identity leaf = MakeIdentity({}, &intermediate);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.chain = {&intermediate};
  const std::string ofIntermediate = MakeCrl(intermediate, nullptr);
  EXPECT_EQ(HandshakeWithCrls({ofIntermediate, MakeCrl(root, nullptr)}, peer), "");
  EXPECT_EQ(HandshakeWithCrls({ofIntermediate, MakeCrl(root, &intermediate)}, peer),
            "TLS handshake with sts.example failed: certificate revoked (CN=Intermediate)");
  EXPECT_EQ(HandshakeWithCrls({ofIntermediate}, peer),
            "TLS handshake with sts.example failed: unable to get certificate CRL "
            "(CN=Intermediate)");
}

}  // namespace
}  // namespace Tarnik::Testing
