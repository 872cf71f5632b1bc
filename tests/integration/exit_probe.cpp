// Ends while calls are in progress: exit_probe URL CA_FILE SIGNING_CERTIFICATE_FILE MICROSECONDS
#include <chrono>
#include <cstdlib>
#include <thread>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 5) {
    return 2;
  }
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[2]};
  const auto sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[3]));
  SsoClient::SecurityTokenServiceConfig config;
  config.url = argv[1];
  config.sslContext = sslContext.get();
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  const auto service = SsoClient::CreateSecurityTokenService(config);
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  for (int i = 0; i < 100; ++i) {
    service->AcquireTokenAsync("alice@EXAMPLE.COM", "secret", spec,
                               [](const auto&, const Tarnik::Exception*) {});
  }
  std::this_thread::sleep_for(std::chrono::microseconds(std::atol(argv[4])));
  return 0;
}
