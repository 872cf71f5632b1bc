#include <gtest/gtest.h>

#include <ssoclient/holder_of_key_config.h>
#include <ssoclient/saml_token_factory.h>
#include <ssoclient/security_token_service_config.h>
#include <tarnik/core/object_impl.h>

#include "support/assertion_text.h"
#include "support/holder_of_key.h"
#include "transport/fake_http.h"
#include "transport/fake_ssl.h"

// Callers initialise the records by position as well as by name, so the order of their fields is
// part of the interface.
namespace SsoClient::Testing {
namespace {

TEST(HolderOfKeyConfigTest, HoldsItsFieldsInOrder) {
  const auto filled = ConfigOf(KeyCredential());
  const HolderOfKeyConfig config{filled.certificate, filled.privateKey};
  EXPECT_EQ(config.certificate, filled.certificate);
  EXPECT_EQ(config.privateKey, filled.privateKey);
}

TEST(SecurityTokenServiceConfigTest, HoldsItsFieldsInOrder) {
  const auto resolver = TrustedResolver();
  const auto factory = CreateSamlTokenFactory(nullptr);
  const auto context = Tarnik::MakeRef<FakeSslContext>();
  const auto key = ConfigOf(KeyCredential());
  const SecurityTokenServiceConfig config{
      "http://sts.example/", resolver.get(), factory, "peer", key, context.get(), true};
  EXPECT_EQ(config.url, "http://sts.example/");
  EXPECT_EQ(config.keyInfoResolver, resolver.get());
  EXPECT_EQ(config.tokenFactory, factory);
  EXPECT_EQ(config.sslPeerName, "peer");
  ASSERT_TRUE(config.holderOfKeyConfig.has_value());
  EXPECT_EQ(config.holderOfKeyConfig->certificate, key.certificate);
  EXPECT_EQ(config.sslContext, context.get());
  EXPECT_TRUE(config.flag);
}

TEST(SecurityTokenServiceConfigExTest, HoldsItsFieldsInOrder) {
  const auto agent = Tarnik::MakeRef<FakeUserAgent>();
  const auto factory = CreateSamlTokenFactory(nullptr);
  const auto key = ConfigOf(KeyCredential());
  const SecurityTokenServiceConfigEx config{"/sts", agent, factory, key};
  EXPECT_EQ(config.url, "/sts");
  EXPECT_EQ(config.userAgent, agent);
  EXPECT_EQ(config.tokenFactory, factory);
  ASSERT_TRUE(config.holderOfKeyConfig.has_value());
  EXPECT_EQ(config.holderOfKeyConfig->privateKey, key.privateKey);
}

TEST(SecurityTokenServiceConfigTest, IsEmptyByDefault) {
  const SecurityTokenServiceConfig config;
  EXPECT_EQ(config.keyInfoResolver, nullptr);
  EXPECT_FALSE(config.holderOfKeyConfig.has_value());
  EXPECT_EQ(config.sslContext, nullptr);
  EXPECT_FALSE(config.flag);
}

}  // namespace
}  // namespace SsoClient::Testing
