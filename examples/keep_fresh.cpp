// Keeps a token for an audience fresh, and prints its end of validity every second until it is
// interrupted: a server's whole obtaining side.
#include <chrono>
#include <fstream>
#include <iostream>
#include <string>
#include <thread>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

int main(int argc, char** argv) {
  if (argc < 6) {
    std::cerr << "usage: keep_fresh CA_FILE STS_CERTIFICATE_FILE USER PASSWORD_FILE URL...\n";
    return 2;
  }
  try {
    Tarnik::Ssl::SSLContextConfig tls;
    tls.caFiles = {argv[1]};
    const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
        Tarnik::Crypto::LoadCertificates(argv[2]));

    SsoClient::Access::TokenSourceConfig config;
    config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
    config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
    for (int i = 5; i < argc; ++i) {
      config.endpoints.push_back({argv[i]});
    }
    config.login = SsoClient::Access::PasswordLogin{argv[3], [file = std::string(argv[4])] {
                                                      std::string password;
                                                      std::ifstream stream(file);
                                                      std::getline(stream, password);
                                                      return password;
                                                    }};
    const auto source = SsoClient::Access::CreateTokenSource(std::move(config));

    SsoClient::TokenSpec spec;
    spec.tokenLifetimeSec = 3600;
    spec.audienceRestriction = {"https://orders.example.com"};
    while (true) {
      try {
        const auto context = SsoClient::Access::CallContext::Within(std::chrono::seconds(2));
        const auto token = source->GetToken(spec, context);
        std::cout << "valid until " << token->ExpirationTime().ToString() << std::endl;
      } catch (const Tarnik::Exception& e) {
        std::cerr << "no token now: " << e.what() << '\n';
      }
      std::this_thread::sleep_for(std::chrono::seconds(1));
    }
  } catch (const std::exception& e) {
    std::cerr << "Cannot start: " << e.what() << '\n';
  }
  return 1;
}
