// Acquires a token by Kerberos with one call per leg. This is for servers that relay the legs
// between the service and a client that creates them.
#include <iostream>

#include <ssoclient/gssapi_negotiation_handler.h>
#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc != 5) {
    std::cerr << "usage: negotiate_by_legs URL CA_FILE STS_CERTIFICATE_FILE SERVICE@HOST\n";
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
    config.keyInfoResolver = trustedKeys.get();
    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    const auto negotiation = SsoClient::InternalApi::CreateGssNegotiationContext(config, spec);

    SsoClient::GssapiNegotiationConfig kerberos;
    kerberos.targetService = argv[4];
    const auto user = SsoClient::CreateGssapiNegotiationHandler(kerberos);
    auto answer = negotiation->Negotiate(*user->Negotiate({}));
    while (answer.token == nullptr) {
      answer = negotiation->Negotiate(*user->Negotiate(*answer.outputLeg));
    }
    if (!answer.outputLeg->empty()) {
      user->Negotiate(*answer.outputLeg);  // verifies the identity of the service
    }
    std::cout << SsoClient::CreateSamlTokenDescription(*answer.token) << '\n';
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "No token: " << e.what() << '\n';
    return 1;
  }
}
