// Acquires a token for the owner of a certificate. The request is signed with the private key.
#include <iostream>

#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 6) {
    std::cerr << "usage: acquire_token_by_certificate URL CA_FILE STS_CERTIFICATE_FILE "
                 "CERTIFICATE_FILE KEY_FILE\n";
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

    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    const auto token = service->AcquireTokenByCertificate(spec);
    std::cout << SsoClient::CreateSamlTokenDescription(*token) << '\n';
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "No token: " << e.what() << '\n';
    return 1;
  }
}
