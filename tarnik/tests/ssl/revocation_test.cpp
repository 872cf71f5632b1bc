#include "ssl/revocation.h"

#include <ctime>
#include <memory>
#include <string>
#include <vector>

#include <gtest/gtest.h>

#include <tarnik/ssl/ssl_context.h>

#include "ssl/tls_fixture.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"
#include "support/tls_peer.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;

constexpr const char* kRevoked =
    "TLS handshake with sts.example:PORT failed: certificate revoked (CN=sts.example)";

TlsPeerOptions LeafPeer() {
  TlsPeerOptions peer;
  peer.identity = &TestPki::Get().leaf;
  return peer;
}

std::string Handshake(const SSLContextConfig& config, const TlsPeerOptions& peer) {
  TlsServer server(peer, 1);
  return TlsClient(*CreateSSLContext(config), server.Port()).Message();
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

TEST(RevocationTest, RefusesARevokedPeer) {
  const Identity& root = TestPki::Get().root;
  const Identity& leaf = TestPki::Get().leaf;
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(root, nullptr)}, LeafPeer()), "");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(root, &leaf)}, LeafPeer()),
            "TLS handshake with sts.example:PORT failed: certificate revoked (CN=sts.example)");
}

TEST(RevocationTest, RefusesAPeerWhoseRevocationListIsMissingOrExpired) {
  const Identity stranger = MakeCa("Stranger");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(stranger, nullptr)}, LeafPeer()),
            "TLS handshake with sts.example:PORT failed: unable to get certificate CRL "
            "(CN=sts.example)");
  EXPECT_EQ(HandshakeWithCrls({MakeCrl(TestPki::Get().root, nullptr, -60)}, LeafPeer()),
            "TLS handshake with sts.example:PORT failed: CRL has expired (CN=sts.example)");
}

TEST(RevocationTest, ChecksTheWholeChainForRevocation) {
  const Identity& root = TestPki::Get().root;
  const Identity& intermediate = TestPki::Get().intermediate;
  const Identity leaf = MakeIdentity({}, &intermediate);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.chain = {&intermediate};
  const std::string ofIntermediate = MakeCrl(intermediate, nullptr);
  EXPECT_EQ(HandshakeWithCrls({ofIntermediate, MakeCrl(root, nullptr)}, peer), "");
  EXPECT_EQ(HandshakeWithCrls({ofIntermediate, MakeCrl(root, &intermediate)}, peer),
            "TLS handshake with sts.example:PORT failed: certificate revoked (CN=Intermediate)");
  EXPECT_EQ(HandshakeWithCrls({ofIntermediate}, peer),
            "TLS handshake with sts.example:PORT failed: unable to get certificate CRL "
            "(CN=Intermediate)");
}

TEST(RevocationTest, CountsARevocationInEachListOfTheNewestDate) {
  const Identity& root = TestPki::Get().root;
  const std::time_t now = std::time(nullptr);
  const std::string without = MakeCrl(root, nullptr, 3600, -3600, now);
  const std::string with = MakeCrl(root, &TestPki::Get().leaf, 3600, -3600, now);
  const std::string ofAnother = MakeCrl(root, &TestPki::Get().intermediate, 3600, -3600, now);
  EXPECT_EQ(HandshakeWithCrls({without, with}, LeafPeer()), kRevoked);
  EXPECT_EQ(HandshakeWithCrls({with, without}, LeafPeer()), kRevoked);
  EXPECT_EQ(HandshakeWithCrls({without, ofAnother, with}, LeafPeer()), kRevoked);
  EXPECT_EQ(HandshakeWithCrls({without, ofAnother}, LeafPeer()), "");
}

TEST(RevocationTest, ReplacesAListByANewerOne) {
  const Identity& root = TestPki::Get().root;
  const Identity& leaf = TestPki::Get().leaf;
  const std::string oldWithout = MakeCrl(root, nullptr, 3600, -7200);
  const std::string oldWith = MakeCrl(root, &leaf, 3600, -7200);
  const std::string newWithout = MakeCrl(root, nullptr, 3600, -3600);
  const std::string newWith = MakeCrl(root, &leaf, 3600, -3600);
  EXPECT_EQ(HandshakeWithCrls({oldWithout, newWith}, LeafPeer()), kRevoked);
  EXPECT_EQ(HandshakeWithCrls({newWith, oldWithout}, LeafPeer()), kRevoked);
  EXPECT_EQ(HandshakeWithCrls({oldWith, newWithout}, LeafPeer()), "");
  EXPECT_EQ(HandshakeWithCrls({newWithout, oldWith}, LeafPeer()), "");
}

TEST(RevocationTest, IgnoresAListOfANamesakeOfTheIssuer) {
  const Identity namesake = MakeCa("Root");
  const std::time_t now = std::time(nullptr);
  const std::string forged = MakeCrl(namesake, &TestPki::Get().leaf, 3600, -3600, now);
  const std::string genuine = MakeCrl(TestPki::Get().root, nullptr, 3600, -3600, now);
  EXPECT_EQ(HandshakeWithCrls({forged, genuine}, LeafPeer()), "");
  EXPECT_EQ(HandshakeWithCrls({genuine, forged}, LeafPeer()), "");
}

TEST(RevocationTest, CountsEachListOfAnIntermediateAuthority) {
  const Identity& root = TestPki::Get().root;
  const Identity& intermediate = TestPki::Get().intermediate;
  const Identity leaf = MakeIdentity({}, &intermediate);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.chain = {&intermediate};
  const std::time_t now = std::time(nullptr);
  const std::string ofRoot = MakeCrl(root, nullptr, 3600, -3600, now);
  const std::string without = MakeCrl(intermediate, nullptr, 3600, -3600, now);
  const std::string with = MakeCrl(intermediate, &leaf, 3600, -3600, now);
  EXPECT_EQ(HandshakeWithCrls({ofRoot, without}, peer), "");
  EXPECT_EQ(HandshakeWithCrls({ofRoot, without, with}, peer), kRevoked);
  EXPECT_EQ(HandshakeWithCrls({ofRoot, with, without}, peer), kRevoked);
}

}  // namespace
}  // namespace Tarnik::Testing
