// Acquires a bearer token by user name and password and prints its description.
#include <iostream>
#include <string>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: acquire_token URL CA_FILE STS_CERTIFICATE_FILE USER < password\n";
    return 2;
  }
  std::string password;
  std::getline(std::cin, password);
  try {
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
    spec.tokenLifetimeSec = 3600;
    const auto token = service->AcquireToken(argv[4], password, spec);
    std::cout << SsoClient::CreateSamlTokenDescription(*token) << '\n';
    return 0;
  } catch (const SsoClient::InvalidCredentialsException& e) {
    std::cerr << "The login was refused: " << e.what() << '\n';
  } catch (const std::exception& e) {
    std::cerr << "No token: " << e.what() << '\n';
  }
  return 1;
}
