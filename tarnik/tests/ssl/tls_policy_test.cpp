#include <string>

#include <gmock/gmock.h>
#include <gtest/gtest.h>

#include <tarnik/ssl/ssl_context.h>

#include "ssl/tls_fixture.h"
#include "support/child_process.h"
#include "support/client_hello.h"
#include "support/temporary_file.h"
#include "support/test_pki.h"
#include "support/tls_peer.h"

// What every ClientHello offers, whatever the environment's configuration of OpenSSL says.
namespace Tarnik::Testing {
namespace {

using testing::AnyOf;
using testing::HasSubstr;
using testing::Not;

/// The output of the probe in a process whose OpenSSL is configured by `configuration`.
std::string OfferWith(const std::string& configuration, const std::string& argument = "") {
  const TemporaryFile file(configuration);
  return RunInShell("OPENSSL_CONF='" + file.Path() + "' " + TARNIK_TLS_POLICY_PROBE + " " +
                    argument)
      .output;
}

std::string SectionForAllContexts(const std::string& settings) {
  return "openssl_conf = all\n[all]\nssl_conf = tls\n[tls]\nsystem_default = policy\n[policy]\n" +
         settings;
}

std::string Offer() {
  return OfferOf(ClientHelloOf(*Ssl::CreateSSLContext({})));
}

constexpr const char* kHostile =
    "MinProtocol = TLSv1\n"
    "CipherString = ALL:COMPLEMENTOFALL@SECLEVEL=0\n"
    "Ciphersuites = TLS_AES_128_CCM_8_SHA256:TLS_AES_128_CCM_SHA256\n"
    "SignatureAlgorithms = ECDSA+SHA1:RSA+SHA1:DSA+SHA1\n"
    "ClientSignatureAlgorithms = ECDSA+SHA1:RSA+SHA1\n"
    "Groups = secp224r1:P-256\n"
    "Options = UnsafeLegacyServerConnect,UnsafeLegacyRenegotiation,AllowNoDHEKEX,Compression,"
    "-ExtendedMasterSecret,-EncryptThenMac\n";

TEST(TlsPolicyTest, OffersAuthenticatedEncryptionWithForwardSecrecyOnly) {
  // A last code point may announce secure renegotiation (RFC 5746, section 3.3); newer versions of
  // OpenSSL announce it with an extension.
  const std::string suites = "suites 1302 1303 1301 c02c c030 cca9 cca8 c02b c02f";
  EXPECT_THAT(Offer(), AnyOf(HasSubstr(suites + "\n"), HasSubstr(suites + " 00ff\n")));
}

TEST(TlsPolicyTest, OffersStrongSignaturesGroupsAndVersionsOnly) {
  EXPECT_THAT(Offer(), HasSubstr("signatures 0403 0503 0603 0807 0808 0809 080a 080b 0804 0805 "
                                 "0806 0401 0501 0601\n"));
  EXPECT_THAT(Offer(), HasSubstr(" 001d 0017 0018 0019\n"));
  EXPECT_THAT(Offer(), HasSubstr("versions 0304 0303\n"));
  EXPECT_THAT(Offer(), HasSubstr("compression 1\n"));
  EXPECT_THAT(Offer(), HasSubstr("key exchange modes 1\n"));
}

TEST(TlsPolicyTest, OffersTheSameUnderAWeakConfiguration) {
  const std::string weak = SectionForAllContexts(kHostile);
  EXPECT_EQ(OfferWith(weak), Offer());
  // The configuration is in effect in that process.
  const std::string unprotected = OfferWith(weak, "default");
  EXPECT_THAT(unprotected, HasSubstr(" 1305 1304 "));
  EXPECT_THAT(unprotected, HasSubstr("signatures 0203 0201"));
  EXPECT_THAT(unprotected, HasSubstr("groups 0015"));
  EXPECT_THAT(unprotected, HasSubstr("key exchange modes 2\n"));
}

TEST(TlsPolicyTest, OffersTheSameUnderAStricterConfiguration) {
  const std::string strict = SectionForAllContexts(
      "MaxProtocol = TLSv1.2\nMinProtocol = TLSv1.2\nCipherString = ECDHE-RSA-AES256-GCM-SHA384\n"
      "SignatureAlgorithms = RSA+SHA512\nGroups = P-521\nOptions = -SessionTicket\n");
  EXPECT_EQ(OfferWith(strict), Offer());
  EXPECT_THAT(OfferWith(strict, "default"), Not(HasSubstr("versions")));
}

struct WeakPeer {
  const char* name;
  const char* ciphers;
  const char* signatures;
};

class WeakPeerTest : public testing::TestWithParam<WeakPeer> {};

TEST_P(WeakPeerTest, IsRefused) {
  IdentityOptions options;
  options.rsaBits = std::string(GetParam().ciphers).find("ECDSA") == std::string::npos ? 2048 : 0;
  const Identity leaf = MakeIdentity(options, &TestPki::Get().root);
  TlsPeerOptions peer;
  peer.identity = &leaf;
  peer.maxVersion = TLS1_2_VERSION;
  peer.securityLevel = 0;
  peer.ciphers = "ALL:@SECLEVEL=0";
  TlsServer tolerant(peer, 1);
  EXPECT_EQ(TlsClient(*TrustingContext(TestPki::Get().root), tolerant.Port()).Message(), "");
  peer.ciphers = GetParam().ciphers;
  peer.signatures = GetParam().signatures;
  TlsServer weak(peer, 1);
  EXPECT_THAT(TlsClient(*TrustingContext(TestPki::Get().root), weak.Port()).Message(),
              testing::StartsWith("TLS handshake with "));
}

INSTANTIATE_TEST_SUITE_P(Peers, WeakPeerTest,
                         testing::Values(WeakPeer{"CbcWithSha1", "ECDHE-ECDSA-AES128-SHA", ""},
                                         WeakPeer{"CbcWithSha384", "ECDHE-RSA-AES256-SHA384", ""},
                                         WeakPeer{"Ccm8", "ECDHE-ECDSA-AES128-CCM8", ""},
                                         WeakPeer{"FiniteFields", "DHE-RSA-AES128-GCM-SHA256", ""},
                                         WeakPeer{"StaticRsa", "AES128-GCM-SHA256", ""},
                                         WeakPeer{"SignatureWithSha1",
                                                  "ECDHE-ECDSA-AES128-GCM-SHA256", "ECDSA+SHA1"},
                                         WeakPeer{"RsaSignatureWithSha224",
                                                  "ECDHE-RSA-AES128-GCM-SHA256", "RSA+SHA224"}),
                         [](const auto& peer) { return peer.param.name; });

}  // namespace
}  // namespace Tarnik::Testing
