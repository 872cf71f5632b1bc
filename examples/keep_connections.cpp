// Asks the service about several tokens over one connection. Ends with status 1 if one is invalid.
#include <fstream>
#include <iostream>
#include <iterator>
#include <stdexcept>
#include <string>

#include <ssoclient/ssoclient.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_url.h>

int main(int argc, char** argv) {
  if (argc < 5 || std::string(argv[1]).rfind("https://", 0) != 0) {
    std::cerr << "usage: keep_connections HTTPS_URL CA_FILE STS_CERTIFICATE_FILE TOKEN_FILE...\n";
    return 2;
  }
  try {
    Tarnik::Ssl::SSLContextConfig tls;
    tls.caFiles = {argv[2]};
    const auto sslContext = Tarnik::Ssl::CreateSSLContext(tls);
    const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
        Tarnik::Crypto::LoadCertificates(argv[3]));
    SsoClient::SecurityTokenServiceConfigEx config;
    bool isHttps = false;
    std::string host;
    int port = 0;
    Tarnik::Http::ParseHttpURL(argv[1], isHttps, host, port, config.url);
    const auto spec = Tarnik::Http::CreateTLSConnectionSpec(host, port, sslContext.get(), "");
    config.userAgent = Tarnik::Http::CreateHttpUserAgent(spec.get(), nullptr, nullptr);
    config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
    const auto service = SsoClient::CreateSecurityTokenService(config);

    int status = 0;
    for (int i = 4; i < argc; ++i) {
      std::ifstream file(argv[i]);
      const std::string text(std::istreambuf_iterator<char>(file), {});
      if (text.empty()) {
        throw std::runtime_error(std::string("cannot read ") + argv[i]);
      }
      const auto token = SsoClient::CreateSamlToken(text, trustedKeys.get());
      const bool isValid = service->ValidateSubject(*token);
      std::cout << (isValid ? "valid: " : "INVALID: ") << argv[i] << '\n';
      status = isValid ? status : 1;
    }
    return status;
  } catch (const std::exception& e) {
    std::cerr << "Not validated: " << e.what() << '\n';
    return 1;
  }
}
