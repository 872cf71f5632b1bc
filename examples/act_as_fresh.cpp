// Acts for the user who gave a token, with two sources: one keeps the server's own token, the other
// exchanges it for each user. Each line of input is a request of the user.
#include <chrono>
#include <fstream>
#include <iostream>
#include <iterator>
#include <string>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) try {
  if (argc != 7) {
    std::cerr << "usage: act_as_fresh URL CA_FILE STS_CERTIFICATE_FILE CERTIFICATE_FILE KEY_FILE"
                 " TOKEN_FILE < lines\n";
    return 2;
  }
  std::ifstream file(argv[6]);
  const std::string text{std::istreambuf_iterator<char>(file), {}};
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[2]};
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[3]));
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;

  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{argv[1]}};
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  config.holderOfKey = SsoClient::HolderOfKeyConfig{
      Tarnik::Crypto::LoadCertificates(argv[4]).front(), Tarnik::Crypto::LoadPrivateKey(argv[5])};
  config.login = SsoClient::Access::CertificateLogin{};
  const auto own = SsoClient::Access::CreateTokenSource(config);
  config.login = SsoClient::Access::TokenLogin{own, spec};
  const auto forUsers = SsoClient::Access::CreateTokenSource(config);

  spec.actAsToken = SsoClient::CreateSamlToken(text, trustedKeys.get());
  for (std::string line; std::getline(std::cin, line);) {
    const auto limit = SsoClient::Access::CallContext::Within(std::chrono::seconds(5));
    const auto token = forUsers->GetToken(spec, limit);
    std::cout << "a token for " << token->Subject().name << " valid until "
              << token->ExpirationTime().ToString() << std::endl;
  }
} catch (const std::exception& e) {
  std::cerr << "No token: " << e.what() << '\n';
  return 1;
}
