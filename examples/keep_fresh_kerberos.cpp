// Keeps a token fresh with a Kerberos login, and uses it for each line of input.
#include <chrono>
#include <iostream>
#include <string>

#include <ssoclient/access/token_source.h>
#include <ssoclient/gssapi_negotiation_handler.h>
#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) try {
  if (argc != 5 && argc != 7) {
    std::cerr << "usage: keep_fresh_kerberos URL CA_FILE STS_CERTIFICATE_FILE SERVICE\n"
                 "                           [PRINCIPAL KEYTAB] < lines\n";
    return 2;
  }
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[2]};
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[3]));
  SsoClient::GssapiNegotiationConfig kerberos;
  kerberos.targetService = argv[4];
  if (argc == 7) {
    kerberos.principal = argv[5];
    kerberos.keytab = argv[6];
  }
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;

  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{argv[1]}};
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  config.login = SsoClient::Access::NegotiatedLogin{
      [=](const auto&) { return SsoClient::CreateGssapiNegotiationHandler(kerberos); }};
  config.keepFresh = {spec};
  const auto source = SsoClient::Access::CreateTokenSource(config);

  for (std::string line; std::getline(std::cin, line);) {
    const auto limit = SsoClient::Access::CallContext::Within(std::chrono::seconds(30));
    const auto token = source->GetToken(spec, limit);
    std::cout << "a token of " << token->Subject().name << " valid until "
              << token->ExpirationTime().ToString() << std::endl;
  }
} catch (const std::exception& e) {
  std::cerr << "No token: " << e.what() << '\n';
  return 1;
}
