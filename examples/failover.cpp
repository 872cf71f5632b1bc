// Requests a token from several services, and prints which of them are asked and which fail.
#include <chrono>
#include <iostream>
#include <memory>
#include <string>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

class Printer final : public SsoClient::Access::AccessListener {
  void OnAttemptBegun(const SsoClient::Access::AttemptRecord& attempt) override {
    std::cout << "attempt " << attempt.number << " at " << attempt.endpoint << std::endl;
  }
  void OnAttemptEnded(const SsoClient::Access::AttemptRecord& attempt) override {
    if (attempt.failure != SsoClient::Access::FailureKind::kNone) {
      std::cout << NameOf(attempt.failure) << ": " << attempt.message << std::endl;
    }
  }
};

int main(int argc, char** argv) try {
  if (argc < 5) {
    std::cerr << "usage: failover CA_FILE STS_CERTIFICATE_FILE USER URL... < password\n";
    return 2;
  }
  std::string password;
  std::getline(std::cin, password);
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[1]};
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[2]));
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  SsoClient::Access::TokenSourceConfig config;
  for (int i = 4; i < argc; ++i) {
    config.endpoints.push_back({argv[i]});
  }
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  config.login = SsoClient::Access::PasswordLogin{argv[3], [=] { return password; }};
  config.retry.attemptTimeout = std::chrono::seconds(5);
  config.listener = std::make_shared<Printer>();
  const auto source = SsoClient::Access::CreateTokenSource(config);
  const auto limit = SsoClient::Access::CallContext::Within(std::chrono::seconds(20));
  const auto token = source->GetToken(spec, limit);
  std::cout << "a token valid until " << token->ExpirationTime().ToString() << '\n';
} catch (const std::exception& e) {
  std::cerr << "No token: " << e.what() << '\n';
  return 1;
}
