#ifndef SSOCLIENT_TESTS_INTEGRATION_PROBE_SERVICE_H
#define SSOCLIENT_TESTS_INTEGRATION_PROBE_SERVICE_H

#include <memory>
#include <string>

#include <ssoclient/ssoclient.h>

namespace SsoClient::Testing {

/// A service as a program makes it from files: the TLS trust and the signing certificate of the
/// STS, and the client's certificate and key, unless that is empty.
struct ProbeService {
  ProbeService(const std::string& url, const std::string& caFile, const std::string& signingFile,
               const std::string& holderFile = "") {
    Tarnik::Ssl::SSLContextConfig tls;
    tls.caFiles = {caFile};
    sslContext = Tarnik::Ssl::CreateSSLContext(tls);
    const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
        Tarnik::Crypto::LoadCertificates(signingFile));
    SecurityTokenServiceConfig config;
    config.url = url;
    config.sslContext = sslContext.get();
    config.tokenFactory = CreateSamlTokenFactory(trustedKeys.get());
    if (!holderFile.empty()) {
      config.holderOfKeyConfig =
          HolderOfKeyConfig{Tarnik::Crypto::LoadCertificates(holderFile).front(),
                            Tarnik::Crypto::LoadPrivateKey(holderFile)};
    }
    service = CreateSecurityTokenService(config);
  }

  std::shared_ptr<const SamlToken> Login() const {
    return service->AcquireToken("alice@EXAMPLE.COM", "secret", Spec());
  }

  static TokenSpec Spec() {
    TokenSpec spec;
    spec.tokenLifetimeSec = 600;
    return spec;
  }

  Tarnik::Ref<Tarnik::Ssl::SSLContext> sslContext;
  std::shared_ptr<SecurityTokenService> service;
};

}  // namespace SsoClient::Testing

#endif
