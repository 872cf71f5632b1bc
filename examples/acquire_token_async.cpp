// Acquires a bearer token by user name and password, asynchronously.
#include <future>
#include <iostream>
#include <memory>
#include <string>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: acquire_token_async URL CA_FILE STS_CERTIFICATE_FILE USER < password\n";
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

    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    const auto result =
        std::make_shared<std::promise<std::shared_ptr<const SsoClient::SamlToken>>>();
    SsoClient::CreateSecurityTokenService(config)->AcquireTokenAsync(
        argv[4], password, spec, [result](const auto& token, const Tarnik::Exception* error) {
          try {
            error == nullptr ? result->set_value(token) : error->Throw();
          } catch (...) {
            result->set_exception(std::current_exception());
          }
        });
    const auto token = result->get_future().get();
    std::cout << SsoClient::CreateSamlTokenDescription(*token) << '\n';
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "No token: " << e.what() << '\n';
    return 1;
  }
}
