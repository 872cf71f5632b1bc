#include "ssl/session_cache.h"

#include <chrono>
#include <cstddef>
#include <string>

#include <gtest/gtest.h>

#include "ssl/tls_fixture.h"
#include "support/forked_child.h"
#include "support/openssl.h"
#include "support/test_pki.h"
#include "support/tls_peer.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;
using namespace std::chrono_literals;

/// A session of a handshake of `version` with a server that presents `leaf`.
OpenSsl::OwnedSslSession MakeSession(int version, const Identity& leaf) {
  // Only a real handshake puts a peer certificate into a session.
  TlsPeerOptions options;
  options.identity = &leaf;
  options.minVersion = options.maxVersion = version;
  const auto serverContext = MakeServerContext(options);
  const OpenSsl::OwnedSslContext clientContext(SSL_CTX_new(TLS_client_method()));
  const OpenSsl::OwnedSsl server(SSL_new(serverContext.get()));
  const OpenSsl::OwnedSsl client(SSL_new(clientContext.get()));
  BIO* near = nullptr;
  BIO* far = nullptr;
  BIO_new_bio_pair(&near, 0, &far, 0);
  SSL_set_bio(client.get(), near, near);
  SSL_set_bio(server.get(), far, far);
  SSL_set_connect_state(client.get());
  SSL_set_accept_state(server.get());
  for (int i = 0; i < 10; ++i) {
    SSL_do_handshake(client.get());
    SSL_do_handshake(server.get());
  }
  char byte = 0;
  SSL_write(server.get(), "x", 1);
  SSL_read(client.get(), &byte, 1);
  OpenSsl::OwnedSslSession session(SSL_get1_session(client.get()));
  SSL_set_shutdown(client.get(), SSL_SENT_SHUTDOWN | SSL_RECEIVED_SHUTDOWN);
  return session;
}

OpenSsl::OwnedSslSession CopyOf(const OpenSsl::OwnedSslSession& session) {
  return OpenSsl::OwnedSslSession(SSL_SESSION_dup(session.get()));
}

class SessionCacheTest : public testing::Test {
 protected:
  const SessionCache::Clock::time_point now_ = SessionCache::Clock::now();
  const OpenSsl::OwnedSslSession tls12_ = MakeSession(TLS1_2_VERSION, TestPki::Get().leaf);
  const OpenSsl::OwnedSslSession tls13_ = MakeSession(TLS1_3_VERSION, TestPki::Get().leaf);
  SessionCache cache_;
};

TEST_F(SessionCacheTest, ReturnsASessionOnlyForItsPeer) {
  cache_.Put("a", CopyOf(tls12_), now_);
  EXPECT_EQ(cache_.Take("b", now_), nullptr);
  EXPECT_NE(cache_.Take("a", now_), nullptr);
}

TEST_F(SessionCacheTest, ReturnsATls13SessionOnceAndATls12SessionRepeatedly) {
  cache_.Put("a", CopyOf(tls13_), now_);
  EXPECT_NE(cache_.Take("a", now_), nullptr);
  EXPECT_EQ(cache_.Take("a", now_), nullptr);
  cache_.Put("a", CopyOf(tls12_), now_);
  EXPECT_NE(cache_.Take("a", now_), nullptr);
  EXPECT_NE(cache_.Take("a", now_), nullptr);
}

TEST_F(SessionCacheTest, DropsSessionsThatAreTooOld) {
  cache_.Put("a", CopyOf(tls12_), now_);
  EXPECT_NE(cache_.Take("a", now_ + SessionCache::kMaxAge - 1s), nullptr);
  EXPECT_EQ(cache_.Take("a", now_ + SessionCache::kMaxAge), nullptr);
  EXPECT_EQ(cache_.Size(), 0U);
}

TEST_F(SessionCacheTest, DropsASessionWhosePeerCertificateHasExpired) {
  IdentityOptions options;
  options.notAfter = -60;
  const auto expired = MakeIdentity(options, &TestPki::Get().root);
  cache_.Put("a", MakeSession(TLS1_2_VERSION, expired), now_);
  EXPECT_EQ(cache_.Size(), 1U);
  EXPECT_EQ(cache_.Take("a", now_), nullptr);
  EXPECT_EQ(cache_.Size(), 0U);
}

TEST_F(SessionCacheTest, LimitsTheSessionsOfOnePeer) {
  for (std::size_t i = 0; i < SessionCache::kMaxSessionsOfPeer + 3; ++i) {
    cache_.Put("a", CopyOf(tls13_), now_);
  }
  EXPECT_EQ(cache_.Size(), SessionCache::kMaxSessionsOfPeer);
}

TEST_F(SessionCacheTest, DropsTheOldestSessionBeyondItsLimit) {
  for (std::size_t i = 0; i < SessionCache::kMaxSessions + 1; ++i) {
    cache_.Put("peer " + std::to_string(i), CopyOf(tls12_), now_);
  }
  EXPECT_EQ(cache_.Size(), SessionCache::kMaxSessions);
  EXPECT_EQ(cache_.Take("peer 0", now_), nullptr);
  EXPECT_NE(cache_.Take("peer 1", now_), nullptr);
}

TEST_F(SessionCacheTest, IsEmptyInAForkedChild) {
  cache_.Put("peer", CopyOf(tls12_), now_);
  EXPECT_TRUE(HoldsInChild([&] {
    const bool wasEmpty = cache_.Take("peer", now_) == nullptr;
    cache_.Put("peer", CopyOf(tls13_), now_);
    return wasEmpty && cache_.Take("peer", now_) != nullptr;
  }));
  EXPECT_NE(cache_.Take("peer", now_), nullptr);
}

}  // namespace
}  // namespace Tarnik::Testing
