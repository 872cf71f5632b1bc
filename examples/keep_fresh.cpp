// A server's whole obtaining side: keeps a token fresh, and uses it for each line of input.
#include <chrono>
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <string>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) try {
  if (argc != 6) {
    std::cerr << "usage: keep_fresh URL CA_FILE STS_CERTIFICATE_FILE USER PASSWORD_FILE < lines\n";
    return 2;
  }
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[2]};
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[3]));
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  spec.audienceRestriction = {"https://orders.example.com"};
  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{argv[1]}};
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  const auto readPassword = [file = std::string(argv[5])] {
    std::string password;
    if (!std::getline(std::ifstream(file), password)) {
      throw std::runtime_error("cannot read " + file);
    }
    return password;
  };
  config.login = SsoClient::Access::PasswordLogin{argv[4], readPassword};
  config.keepFresh = {spec};
  config.listener = SsoClient::Access::CreateLogListener();
  const auto source = SsoClient::Access::CreateTokenSource(config);
  for (std::string line; std::getline(std::cin, line);) {
    try {
      const auto limit = SsoClient::Access::CallContext::Within(std::chrono::seconds(5));
      const auto token = source->GetToken(spec, limit);
      std::cout << "a token valid until " << token->ExpirationTime().ToString() << std::endl;
    } catch (const std::exception& e) {
      std::cout << "no token now: " << e.what() << std::endl;
    }
  }
} catch (const std::exception& e) {
  std::cerr << "Cannot start: " << e.what() << '\n';
  return 1;
}
