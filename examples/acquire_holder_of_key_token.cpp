// Acquires a holder-of-key token by password and saves its text to a file. Without the private key,
// the file is of no use to anyone.
#include <fstream>
#include <iostream>
#include <stdexcept>
#include <string>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 8) {
    std::cerr << "usage: acquire_holder_of_key_token URL CA_FILE STS_CERTIFICATE_FILE "
                 "CERTIFICATE_FILE KEY_FILE USER TOKEN_FILE < password\n";
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
    config.holderOfKeyConfig = SsoClient::HolderOfKeyConfig{
        Tarnik::Crypto::LoadCertificates(argv[4]).front(), Tarnik::Crypto::LoadPrivateKey(argv[5])};
    const auto service = SsoClient::CreateSecurityTokenService(config);

    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    spec.renewable = true;
    spec.delegable = true;
    const auto token = service->AcquireToken(argv[6], password, spec);
    std::cout << SsoClient::CreateSamlTokenDescription(*token) << '\n';
    if (!(std::ofstream(argv[7]) << token->Xml()).flush()) {
      throw std::runtime_error(std::string("cannot write ") + argv[7]);
    }
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "No token: " << e.what() << '\n';
    return 1;
  }
}
