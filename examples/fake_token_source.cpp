// Tests a function that uses a token source, without a service: the source is a class of its own.
#include <fstream>
#include <iostream>
#include <iterator>
#include <string>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

class FakeTokenSource final : public SsoClient::Access::TokenSource {
 public:
  using Token = std::shared_ptr<const SsoClient::SamlToken>;
  using Spec = SsoClient::TokenSpec;
  using Context = SsoClient::Access::CallContext;

  Token GetToken(const Spec&, const Context&) override {
    return token == nullptr ? throw SsoClient::CommunicationException("down") : token;
  }
  Token TryGetToken(const Spec&) override { return token; }
  void GetTokenAsync(const Spec&, const Context&, TokenCallback callback) override {
    const SsoClient::CommunicationException failure("down");
    callback(token, token == nullptr ? &failure : nullptr);
  }
  void Invalidate(const SsoClient::SamlToken&) override { token = nullptr; }
  SsoClient::Access::TokenSourceMetrics Metrics() const override { return {}; }
  bool Stop(std::chrono::milliseconds) override { return true; }

  Token token;
};

std::string StatusPage(SsoClient::Access::TokenSource& source) try {
  return "user " + source.GetToken({})->Subject().name;
} catch (const SsoClient::CommunicationException&) {
  return "please try again later";
}

int main(int argc, char** argv) try {
  if (argc != 2) {
    std::cerr << "usage: fake_token_source TOKEN_FILE\n";
    return 2;
  }
  std::ifstream file(argv[1]);
  FakeTokenSource source;
  std::cout << StatusPage(source) << '\n';
  source.token = SsoClient::CreateSamlToken(std::string(std::istreambuf_iterator<char>(file), {}));
  std::cout << StatusPage(source) << '\n';
} catch (const std::exception& e) {
  std::cerr << "fake_token_source: " << e.what() << '\n';
  return 1;
}
