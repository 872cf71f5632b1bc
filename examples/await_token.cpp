// Requests tokens for two audiences at once, in coroutines that do not occupy a thread each.
#include <future>
#include <iostream>
#include <string>

#include <ssoclient/access/awaitable.h>
#include <ssoclient/ssoclient.h>

struct Text : std::future<std::string> {  // the result of a coroutine
  struct promise_type : std::promise<std::string> {
    Text get_return_object() { return {get_future()}; }
    std::suspend_never initial_suspend() noexcept { return {}; }
    std::suspend_never final_suspend() noexcept { return {}; }
    void return_value(std::string text) { set_value(std::move(text)); }
    void unhandled_exception() { set_exception(std::current_exception()); }
  };
};

Text Describe(std::shared_ptr<SsoClient::Access::TokenSource> source, std::string audience) {
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  spec.audienceRestriction = {audience};
  const auto token = co_await SsoClient::Access::AwaitToken(std::move(source), spec);
  co_return std::move(audience) + ": until " + token->ExpirationTime().ToString();
}

int main(int argc, char** argv) try {
  if (argc != 5) {
    std::cerr << "usage: await_token URL CA_FILE STS_CERTIFICATE_FILE USER < password\n";
    return 2;
  }
  std::string password;
  std::getline(std::cin, password);
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {argv[2]};
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(argv[3]));
  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{argv[1]}};
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  config.login = SsoClient::Access::PasswordLogin{argv[4], [=] { return password; }};
  const auto source = SsoClient::Access::CreateTokenSource(config);
  auto orders = Describe(source, "https://orders.example.com");
  auto stock = Describe(source, "https://stock.example.com");
  std::cout << orders.get() << '\n' << stock.get() << '\n';
} catch (const std::exception& e) {
  std::cerr << "No token: " << e.what() << '\n';
  return 1;
}
