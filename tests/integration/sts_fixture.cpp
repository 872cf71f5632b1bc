#include "integration/sts_fixture.h"

#include <memory>
#include <string>

namespace SsoClient::Testing {

Tarnik::Ref<Tarnik::Ssl::SSLContext> TrustCa(const DevSts::Server& server) {
  Tarnik::Ssl::SSLContextConfig config;
  config.caCertificates = Tarnik::Crypto::CreateCertificatesFromPem(server.CaCertificatePem());
  return Tarnik::Ssl::CreateSSLContext(config);
}

Tarnik::Ref<const Tarnik::Xml::Security::KeyInfoResolver> TrustSigner(const std::string& pem) {
  return Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      {Tarnik::Crypto::CreateCertificatesFromPem(pem).front()});
}

std::shared_ptr<SecurityTokenService> MakeService(
    const DevSts::Server& server, const std::string& url,
    const boost::optional<HolderOfKeyConfig>& holderOfKeyConfig) {
  const auto sslContext = TrustCa(server);
  SecurityTokenServiceConfig config;
  config.url = url;
  config.sslContext = sslContext.get();
  config.tokenFactory = CreateSamlTokenFactory(TrustSigner(server.SigningCertificatePem()).get());
  config.holderOfKeyConfig = holderOfKeyConfig;
  return CreateSecurityTokenService(config);
}

TokenSpec TenMinutes() {
  TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  return spec;
}

StsTest::StsTest() {
  Sts().ClearMisbehavior();
  Sts().SetAssertionOptions({});
  Sts().SetUsers(DevSts::DemoUsers());
  Sts().ClearRequests();
}

DevSts::Server& StsTest::Sts() {
  static DevSts::Server server;
  return server;
}

}  // namespace SsoClient::Testing
