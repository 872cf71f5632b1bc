#include "ssl/peer_check.h"

#include <ostream>
#include <string>
#include <vector>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/ssl/ssl_context.h>
#include <tarnik/ssl/ssl_exception.h>

#include "ssl/tls_fixture.h"
#include "support/test_pki.h"
#include "support/tls_peer.h"

namespace Tarnik::Testing {
namespace {

using namespace Tarnik::Ssl;

/// Checks that the class of a handshake's failure shows whether the peer is another one.
void ExpectClassFor(const TlsClient& client) {
  const std::string message = client.Message();
  const bool isOtherPeer = message.find(" does not name ") != std::string::npos;
  EXPECT_EQ(client.Handshake().IsError<PeerNameException>(), isOtherPeer) << message;
  EXPECT_EQ(client.Handshake().IsError<PeerTrustException>(), !message.empty() && !isOtherPeer)
      << message;
}

/// The message of a handshake with a server whose certificate is made by `options` and issued by
/// the trusted root; empty when it succeeds.
std::string HandshakeWith(const IdentityOptions& options, const std::string& host,
                          const std::string& serverName = "") {
  const Identity leaf = MakeIdentity(options, &TestPki::Get().root);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  TlsServer server(peer, 1);
  const auto context = TrustingContext(TestPki::Get().root);
  const TlsClient client(*context, server.Port(), host, serverName);
  ExpectClassFor(client);
  EXPECT_EQ(client.Handshake().Count(), 1);
  return client.Message();
}

struct NameCase {
  const char* what;
  std::vector<std::string> dnsNames;
  std::vector<std::string> addresses;
  std::string host;
  bool isAccepted;
};

std::ostream& operator<<(std::ostream& stream, const NameCase& nameCase) {
  return stream << nameCase.what;
}

class PeerCheckNameTest : public testing::TestWithParam<NameCase> {};

TEST_P(PeerCheckNameTest, ComparesTheExpectedPeerWithTheCertificate) {
  const NameCase& nameCase = GetParam();
  IdentityOptions options;
  options.commonName = "leaf";
  options.dnsNames = nameCase.dnsNames;
  options.addresses = nameCase.addresses;
  const std::string refusal = "TLS handshake with " + nameCase.host +
                              ":PORT failed: the certificate (CN=leaf) does not name '" +
                              nameCase.host + "'";
  EXPECT_EQ(HandshakeWith(options, nameCase.host), nameCase.isAccepted ? "" : refusal);
}

INSTANTIATE_TEST_SUITE_P(
    Cases, PeerCheckNameTest,
    testing::Values(
        NameCase{"the name", {"sts.example"}, {}, "sts.example", true},
        NameCase{"the name in other case", {"STS.example"}, {}, "sts.EXAMPLE", true},
        NameCase{"one name of several", {"a.example", "sts.example"}, {}, "sts.example", true},
        NameCase{"another name", {"other.example"}, {}, "sts.example", false},
        NameCase{"a longer name", {"sts.example.evil"}, {}, "sts.example", false},
        NameCase{"a subdomain", {"sts.example"}, {}, "a.sts.example", false},
        NameCase{"the parent domain", {"a.sts.example"}, {}, "sts.example", false},
        NameCase{"no name at all", {}, {}, "sts.example", false},
        NameCase{"a NUL after the name",
                 {std::string("sts.example\0.evil", 17)},
                 {},
                 "sts.example",
                 false},
        NameCase{"a NUL at the end", {std::string("sts.example\0", 12)}, {}, "sts.example", false},
        NameCase{"wildcard, one label", {"*.example.com"}, {}, "a.example.com", true},
        NameCase{"wildcard, two labels", {"*.example.com"}, {}, "a.b.example.com", false},
        NameCase{"wildcard, no label", {"*.example.com"}, {}, "example.com", false},
        NameCase{"partial wildcard", {"a*.example.com"}, {}, "ab.example.com", false},
        NameCase{"wildcard inside", {"a.*.com"}, {}, "a.example.com", false},
        NameCase{"wildcard of a top-level domain", {"*.com"}, {}, "example.com", false},
        NameCase{"bare wildcard", {"*"}, {}, "localhost", false},
        NameCase{"the IPv4 address", {}, {"127.0.0.1"}, "127.0.0.1", true},
        NameCase{"another IPv4 address", {}, {"127.0.0.2"}, "127.0.0.1", false},
        NameCase{"the IPv6 address", {}, {"::1"}, "0:0:0:0:0:0:0:1", true},
        NameCase{"a name that looks like the address", {"127.0.0.1"}, {}, "127.0.0.1", false},
        NameCase{"a wildcard for an address", {"*.0.0.1"}, {}, "127.0.0.1", false},
        NameCase{"an address for a name", {}, {"127.0.0.1"}, "localhost", false}));

TEST(PeerCheckTest, IgnoresTheCommonName) {
  IdentityOptions options;
  options.commonName = "sts.example";
  options.dnsNames = {};
  EXPECT_EQ(
      HandshakeWith(options, "sts.example"),
      "TLS handshake with sts.example:PORT failed: the certificate (CN=sts.example) does not name "
      "'sts.example'");
}

TEST(PeerCheckTest, PrefersTheServerNameToTheHost) {
  EXPECT_EQ(HandshakeWith({}, "10.0.0.1", "sts.example"), "");
  EXPECT_EQ(
      HandshakeWith({}, "sts.example", "other.example"),
      "TLS handshake with sts.example:PORT failed: the certificate (CN=sts.example) does not name "
      "'other.example'");
}

TEST(PeerCheckTest, AcceptsANameWithATrailingDot) {
  EXPECT_EQ(HandshakeWith({}, "sts.example."), "");
}

TEST(PeerCheckTest, EscapesTheNamesThatAPeerChooses) {
  IdentityOptions options;
  options.commonName = "a\r\nb\x01 \"";
  options.dnsNames = {};
  EXPECT_EQ(
      HandshakeWith(options, "sts.example"),
      "TLS handshake with sts.example:PORT failed: the certificate (CN=a\\0D\\0Ab\\01 \\\") does "
      "not name 'sts.example'");
}

struct DateCase {
  const char* cause;
  long notBefore;
  long notAfter;
};

TEST(PeerCheckTest, RefusesCertificatesOutsideTheirValidity) {
  for (const DateCase& dates : {DateCase{"certificate has expired", -7200, -60},
                                DateCase{"certificate is not yet valid", 60, 7200}}) {
    IdentityOptions options;
    options.notBefore = dates.notBefore;
    options.notAfter = dates.notAfter;
    EXPECT_EQ(HandshakeWith(options, "sts.example"),
              std::string("TLS handshake with sts.example:PORT failed: ") + dates.cause +
                  " (CN=sts.example)");
  }
}

TEST(PeerCheckTest, RefusesACertificateForClientsOnly) {
  IdentityOptions options;
  options.extendedKeyUsage = "clientAuth";
  EXPECT_THAT(HandshakeWith(options, "sts.example"),
              testing::MatchesRegex("TLS handshake with sts.example:PORT failed: .*purpose.*"));
  options.extendedKeyUsage = "serverAuth";
  EXPECT_EQ(HandshakeWith(options, "sts.example"), "");
}

TEST(PeerCheckTest, SendsNamesBySniButNotAddresses) {
  IdentityOptions options;
  options.addresses = {"127.0.0.1"};
  const Identity leaf = MakeIdentity(options, &TestPki::Get().root);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  TlsServer server(peer, 3);
  const auto context = TrustingContext(TestPki::Get().root);
  for (const char* host : {"sts.example", "sts.example.", "127.0.0.1"}) {
    EXPECT_EQ(TlsClient(*context, server.Port(), host).Message(), "");
  }
  const auto& seen = server.Join();
  ASSERT_EQ(seen.size(), 3U);
  EXPECT_EQ(seen[0].serverName, "sts.example");
  EXPECT_EQ(seen[1].serverName, "sts.example");
  EXPECT_EQ(seen[2].serverName, "");
}

std::string HandshakeWithPins(const std::vector<const Identity*>& pins) {
  SSLContextConfig config = TrustingConfig(TestPki::Get().root);
  for (const Identity* pin : pins) {
    config.pinnedCertificates.push_back(pin->ToCertificate());
  }
  TlsPeerOptions peer;
  peer.identity = &TestPki::Get().leaf;
  TlsServer server(peer, 1);
  const auto context = CreateSSLContext(config);
  const TlsClient client(*context, server.Port());
  ExpectClassFor(client);
  return client.Message();
}

TEST(PeerCheckTest, AcceptsOnlyAPinnedCertificate) {
  const Identity other = MakeIdentity({}, &TestPki::Get().root);
  EXPECT_EQ(HandshakeWithPins({&TestPki::Get().leaf}), "");
  EXPECT_EQ(HandshakeWithPins({&other, &TestPki::Get().leaf}), "");
  EXPECT_EQ(
      HandshakeWithPins({&other}),
      "TLS handshake with sts.example:PORT failed: the certificate (CN=sts.example) is not one of "
      "the pinned certificates");
  EXPECT_EQ(
      HandshakeWithPins({&TestPki::Get().root}),
      "TLS handshake with sts.example:PORT failed: the certificate (CN=sts.example) is not one of "
      "the pinned certificates");
}

TEST(PeerCheckTest, DoesNotTrustACertificateOnlyBecauseItIsPinned) {
  const Identity selfSigned = MakeIdentity({}, nullptr);
  SSLContextConfig config;
  config.pinnedCertificates = {selfSigned.ToCertificate()};
  TlsPeerOptions peer;
  peer.identity = &selfSigned;
  TlsServer server(peer, 1);
  EXPECT_EQ(TlsClient(*CreateSSLContext(config), server.Port()).Message(),
            "TLS handshake with sts.example:PORT failed: self-signed certificate (CN=sts.example)");
}

}  // namespace
}  // namespace Tarnik::Testing
