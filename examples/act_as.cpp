// Acquires a token with which the owner of a certificate acts on behalf of a user. The user's own
// token must be delegable.
#include <fstream>
#include <iostream>
#include <iterator>
#include <stdexcept>
#include <string>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 7) {
    std::cerr << "usage: act_as URL CA_FILE STS_CERTIFICATE_FILE CERTIFICATE_FILE KEY_FILE "
                 "USERS_TOKEN_FILE\n";
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
    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    const auto ownToken = service->AcquireTokenByCertificate(spec);
    spec.actAsToken = SsoClient::CreateSamlToken(text, trustedKeys.get());
    const auto token = service->AcquireTokenByToken(*ownToken, spec);
    std::cout << SsoClient::CreateSamlTokenDescription(*token) << '\n';
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "No token: " << e.what() << '\n';
    return 1;
  }
}
