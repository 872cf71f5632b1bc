// Renews a token that is renewable and bound to the key.
#include <fstream>
#include <iostream>
#include <iterator>
#include <stdexcept>
#include <string>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 7) {
    std::cerr << "usage: renew_token URL CA_FILE STS_CERTIFICATE_FILE CERTIFICATE_FILE KEY_FILE "
                 "TOKEN_FILE\n";
    return 2;
  }
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

    std::ifstream file(argv[6]);
    const std::string text(std::istreambuf_iterator<char>(file), {});
    if (text.empty()) {
      throw std::runtime_error(std::string("cannot read ") + argv[6]);
    }
    const auto token = SsoClient::CreateSamlToken(text, trustedKeys.get());
    const auto renewed = service->RenewToken(*token, 2 * 3600);
    std::cout << SsoClient::CreateSamlTokenDescription(*renewed) << '\n';
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "Not renewed: " << e.what() << '\n';
    return 1;
  }
}
