// Offers the metrics of a token source to Prometheus, and requests a token for each line of input.
#include <fstream>
#include <iostream>
#include <memory>
#include <string>

#include <prometheus/exposer.h>

#include <ssoclient/ssoclient.h>

#include "prometheus_metrics.h"

int main(int argc, char** argv) try {
  if (argc != 6) {
    std::cerr << "usage: export_metrics URL CA_FILE STS_CERTIFICATE_FILE USER PASSWORD_FILE\n";
    return 2;
  }
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[2]};
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[3]));
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;

  const auto registry = std::make_shared<prometheus::Registry>();
  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{argv[1]}};
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  config.login = SsoClient::Access::PasswordLogin{argv[4], [file = argv[5]] {
                                                    std::string password;
                                                    std::getline(std::ifstream(file), password);
                                                    return password;
                                                  }};
  config.listener = std::make_shared<AttemptDurations>(registry);
  const auto source = SsoClient::Access::CreateTokenSource(config);
  const auto counters = std::make_shared<SourceCounters>(source);

  prometheus::Exposer exposer("127.0.0.1:0");  // any free port
  exposer.RegisterCollectable(registry);
  exposer.RegisterCollectable(counters);
  std::cout << "http://127.0.0.1:" << exposer.GetListeningPorts().front() << "/metrics"
            << std::endl;
  for (std::string line; std::getline(std::cin, line);) {
    std::cout << source->GetToken(spec)->ExpirationTime().ToString() << std::endl;
  }
} catch (const std::exception& e) {
  std::cerr << "No token: " << e.what() << '\n';
  return 1;
}
