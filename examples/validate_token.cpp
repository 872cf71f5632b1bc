// Asks the service whether a token is still valid. Ends with status 1 if it is not.
#include <fstream>
#include <iostream>
#include <iterator>
#include <stdexcept>
#include <string>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: validate_token URL CA_FILE STS_CERTIFICATE_FILE TOKEN_FILE\n";
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
    const auto service = SsoClient::CreateSecurityTokenService(config);

    std::ifstream file(argv[4]);
    const std::string text(std::istreambuf_iterator<char>(file), {});
    if (text.empty()) {
      throw std::runtime_error(std::string("cannot read ") + argv[4]);
    }
    const auto token = SsoClient::CreateSamlToken(text, trustedKeys.get());
    const bool isValid = service->ValidateSubject(*token);
    std::cout << (isValid ? "valid: " : "INVALID: ")
              << SsoClient::CreateSamlTokenDescription(*token) << '\n';
    return isValid ? 0 : 1;
  } catch (const std::exception& e) {
    std::cerr << "Not validated: " << e.what() << '\n';
    return 1;
  }
}
