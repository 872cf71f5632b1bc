#ifndef SSOCLIENT_TESTS_FAULTS_STS_CLIENT_H
#define SSOCLIENT_TESTS_FAULTS_STS_CLIENT_H

#include <memory>
#include <string>
#include <utility>

#include <devsts/server.h>
#include <ssoclient/ssoclient.h>

namespace SsoClient::Testing {

inline constexpr char kUser[] = "alice@EXAMPLE.COM";
inline constexpr char kPassword[] = "secret";

/// A dev STS with a client that trusts it.
class StsClient {
 public:
  /// `host` must be a name of the loopback interface.
  static StsClient WithTls(const std::string& host = "127.0.0.1") {
    auto sts = std::make_unique<DevSts::Server>();
    const std::string url = sts->HttpsUrlFor(host);
    return StsClient(std::move(sts), url);
  }
  static StsClient WithoutTls() {
    auto sts = std::make_unique<DevSts::Server>();
    const std::string url = sts->HttpUrl();
    return StsClient(std::move(sts), url);
  }

  std::shared_ptr<const SamlToken> Login() const {
    return service_->AcquireToken(kUser, kPassword, Spec());
  }
  const SecurityTokenService& Service() const { return *service_; }

  static TokenSpec Spec() {
    TokenSpec spec;
    spec.tokenLifetimeSec = 600;
    return spec;
  }

 private:
  StsClient(std::unique_ptr<DevSts::Server> sts, const std::string& url) : sts_(std::move(sts)) {
    Tarnik::Ssl::SSLContextConfig tls;
    tls.caCertificates = Tarnik::Crypto::CreateCertificatesFromPem(sts_->CaCertificatePem());
    sslContext_ = Tarnik::Ssl::CreateSSLContext(tls);
    const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
        Tarnik::Crypto::CreateCertificatesFromPem(sts_->SigningCertificatePem()));
    SecurityTokenServiceConfig config;
    config.url = url;
    config.sslContext = sslContext_.get();
    config.tokenFactory = CreateSamlTokenFactory(trustedKeys.get());
    service_ = CreateSecurityTokenService(config);
  }

  std::unique_ptr<DevSts::Server> sts_;
  Tarnik::Ref<Tarnik::Ssl::SSLContext> sslContext_;
  std::shared_ptr<SecurityTokenService> service_;
};

}  // namespace SsoClient::Testing

#endif
