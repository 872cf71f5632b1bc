// Acquires a token by Kerberos: with the tickets in the process's default credential cache, or with
// a keytab.
#include <iostream>

#include <ssoclient/gssapi_negotiation_handler.h>
#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 5 && argc != 7) {
    std::cerr << "usage: acquire_token_by_gss URL CA_FILE STS_CERTIFICATE_FILE SERVICE@HOST "
                 "[PRINCIPAL KEYTAB_FILE]\n";
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

    SsoClient::GssapiNegotiationConfig kerberos;
    kerberos.targetService = argv[4];
    if (argc == 7) {
      kerberos.principal = argv[5];
      kerberos.keytab = argv[6];
    }
    const auto handler = SsoClient::CreateGssapiNegotiationHandler(kerberos);

    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    const auto token = service->AcquireTokenByGSS(spec, *handler);
    std::cout << SsoClient::CreateSamlTokenDescription(*token) << '\n';
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "No token: " << e.what() << '\n';
    return 1;
  }
}
