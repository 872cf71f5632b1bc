#include "ssl/trust_store.h"

#include <gmock/gmock.h>
#include <gtest/gtest.h>
#include <sys/stat.h>
#include <unistd.h>

#include <cstdio>
#include <string>
#include <vector>

#include "ssl/tls_fixture.h"

namespace Tarnik::Ssl {
namespace {

using Testing::Identity;
using Testing::MakeCrl;
using Testing::MakeIdentity;
using Testing::TemporaryFile;
using Testing::TestPki;
using Testing::TlsClient;
using Testing::TlsPeerOptions;
using Testing::TlsServer;

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
  try {
    CreateSSLContext(config);
  } catch (const SSLException& e) {
    return e.Message();
  }
  return "";
}

TEST(TrustStore, TrustsNobodyByDefault) {
  EXPECT_EQ(Handshake({}, LeafPeer()),
            "TLS handshake with sts.example failed: unable to get local issuer certificate "
            "(CN=sts.example, issued by CN=Root)");
}

TEST(TrustStore, RefusesASelfSignedPeer) {
  const Identity selfSigned = MakeIdentity({}, nullptr);
  TlsPeerOptions peer;
  peer.identity = &selfSigned;
  SSLContextConfig config;
  config.caCertificates = {TestPki::Get().root.ToCertificate()};
  EXPECT_EQ(Handshake(config, peer),
            "TLS handshake with sts.example failed: self-signed certificate (CN=sts.example)");
}

TEST(TrustStore, TrustsNoRootThatThePeerBringsAlong) {
  const Identity stranger = Testing::MakeCa("Stranger");
  const Identity leaf = MakeIdentity({}, &stranger);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.chain = {&stranger};
  SSLContextConfig config;
  config.caCertificates = {TestPki::Get().root.ToCertificate()};
  EXPECT_EQ(Handshake(config, peer),
            "TLS handshake with sts.example failed: self-signed certificate in certificate chain "
            "(CN=Stranger)");
}

TEST(TrustStore, RefusesAForgedRootOfTheSameName) {
  const Identity forged = Testing::MakeCa("Root");
  const Identity leaf = MakeIdentity({}, &forged);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  SSLContextConfig config;
  config.caCertificates = {TestPki::Get().root.ToCertificate()};
  EXPECT_NE(Handshake(config, peer), "");
}

TEST(TrustStore, NeedsTheIntermediateFromThePeer) {
  const Identity leaf = MakeIdentity({}, &TestPki::Get().intermediate);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  SSLContextConfig config;
  config.caCertificates = {TestPki::Get().root.ToCertificate()};
  EXPECT_EQ(Handshake(config, peer),
            "TLS handshake with sts.example failed: unable to get local issuer certificate "
            "(CN=sts.example, issued by CN=Intermediate)");
  peer.chain = {&TestPki::Get().intermediate};
  EXPECT_EQ(Handshake(config, peer), "");
}

TEST(TrustStore, RefusesALeafAsIssuer) {
  const Identity leaf = MakeIdentity({}, &TestPki::Get().leaf);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.chain = {&TestPki::Get().leaf};
  SSLContextConfig config;
  config.caCertificates = {TestPki::Get().root.ToCertificate()};
  EXPECT_THAT(Handshake(config, peer),
              testing::StartsWith("TLS handshake with sts.example failed: invalid CA certificate"));
}

TEST(TrustStore, LoadsCaFiles) {
  const TemporaryFile other(Testing::MakeCa("Other").Pem());
  const TemporaryFile both(Testing::MakeCa("Third").Pem() + TestPki::Get().root.Pem());
  SSLContextConfig config;
  config.caFiles = {other.Path(), both.Path()};
  EXPECT_EQ(Handshake(config, LeafPeer()), "");
}

TEST(TrustStore, LoadsCaFoldersByHash) {
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

TEST(TrustStore, LoadsTheSystemStore) {
  SSLContextConfig config;
  config.useSystemStore = true;
  EXPECT_EQ(MessageOf(config), "");
  EXPECT_THAT(Handshake(config, LeafPeer()), testing::HasSubstr("unable to get local issuer"));
}

TEST(TrustStore, NamesWhatItCannotLoad) {
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

TEST(TrustStore, RefusesNullCertificates) {
  SSLContextConfig config;
  config.caCertificates = {nullptr};
  EXPECT_THROW(CreateSSLContext(config), InvalidArgumentException);
  config.caCertificates = {};
  config.pinnedCertificates = {nullptr};
  EXPECT_THROW(CreateSSLContext(config), InvalidArgumentException);
}

std::string HandshakeWithCrls(const std::vector<std::string>& crls, const TlsPeerOptions& peer) {
  std::vector<std::unique_ptr<TemporaryFile>> files;
  SSLContextConfig config;
  config.caCertificates = {TestPki::Get().root.ToCertificate()};
  for (const std::string& crl : crls) {
    files.push_back(std::make_unique<TemporaryFile>(crl));
    config.crlFiles.push_back(files.back()->Path());
  }
  return Handshake(config, peer);
}

TEST(TrustStore, RefusesARevokedPeer) {
  const Identity& root = TestPki::Get().root;
  const Identity& leaf = TestPki::Get().leaf;
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(root, nullptr)}, LeafPeer()), "");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(root, &leaf)}, LeafPeer()),
            "TLS handshake with sts.example failed: certificate revoked (CN=sts.example)");
}

TEST(TrustStore, RefusesAPeerWhoseRevocationListIsMissingOrOld) {
  const Identity stranger = Testing::MakeCa("Stranger");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(stranger, nullptr)}, LeafPeer()),
            "TLS handshake with sts.example failed: unable to get certificate CRL "
            "(CN=sts.example)");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(TestPki::Get().root, nullptr, -60)}, LeafPeer()),
            "TLS handshake with sts.example failed: CRL has expired (CN=sts.example)");
}

TEST(TrustStore, ChecksTheWholeChainForRevocation) {
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
}  // namespace Tarnik::Ssl
