// A plug-in that uses a token source, while its host does not.
#include "plugin/plugin.h"

#include <atomic>
#include <chrono>
#include <memory>
#include <string>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>

namespace {

using namespace SsoClient::Access;

constexpr int kCalls = 20;

class CountingListener final : public AccessListener {
 public:
  void OnAttemptBegun(const AttemptRecord&) override { ++attempts; }
  void OnAttemptEnded(const AttemptRecord&) override { ++attempts; }

  std::atomic<int> attempts{0};
};

SsoClient::TokenSpec SpecFor(int number) {
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 600;
  spec.audienceRestriction = {"https://audience-" + std::to_string(number) + ".example.com"};
  return spec;
}

TokenSourceConfig Config(const char* url, const char* caPem, const char* signingPem) {
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caCertificates = Tarnik::Crypto::CreateCertificatesFromPem(caPem);
  TokenSourceConfig config;
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      {Tarnik::Crypto::CreateCertificatesFromPem(signingPem).front()});
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  config.endpoints = {{url, ""}};
  config.login = PasswordLogin{"alice@EXAMPLE.COM", [] { return std::string("secret"); }};
  // Refreshes are under way all the time.
  config.refresh.fraction = 0.0001;
  config.refresh.jitter = 0;
  config.keepFresh = {SpecFor(0), SpecFor(1)};
  config.listener = std::make_shared<CountingListener>();
  return config;
}

}  // namespace

const char* UseTokenSource(const char* url, const char* caPem, const char* signingPem) {
  std::atomic<int> reports{0};
  auto source = CreateTokenSource(Config(url, caPem, signingPem));
  try {
    source->GetToken(SpecFor(0));
  } catch (const std::exception&) {
    return "the call failed";
  }
  for (int i = 0; i < kCalls; ++i) {
    source->GetTokenAsync(SpecFor(i), {},
                          [&reports](const auto&, const Tarnik::Exception*) { ++reports; });
  }
  if (!source->Stop(std::chrono::seconds(60))) {
    return "a function of the plug-in is still running";
  }
  if (reports != kCalls) {
    return "a call has not reported";
  }
  source.reset();
  return nullptr;
}
