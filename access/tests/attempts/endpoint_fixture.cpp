#include "attempts/endpoint_fixture.h"

#include "support/holder_of_key.h"

namespace SsoClient::Access {

TokenSourceConfig ConfigFor(const DevSts::Server& server) {
  TokenSourceConfig config;
  config.sslContext = SsoClient::Testing::TrustCa(server);
  config.tokenFactory =
      CreateSamlTokenFactory(SsoClient::Testing::TrustSigner(server.SigningCertificatePem()).get());
  config.login = PasswordLogin{kUser, [] { return std::string(kPassword); }};
  return config;
}

Tarnik::Ref<Tarnik::Http::CallLimit> AMinute() {
  return Tarnik::Http::CreateCallLimit(std::chrono::steady_clock::now() + std::chrono::minutes(1));
}

AttemptOutcome AttemptAt(const TokenSourceConfig& config, const std::string& url,
                         const TokenSpec& spec, const std::string& secret) {
  const auto client = CreateEndpointClient(config, {url, ""});
  return client->Attempt({AttemptOperation::kLogin, spec, nullptr, secret}, *AMinute());
}

TokenSourceConfig EndpointTest::BoundConfig() {
  TokenSourceConfig config = Config();
  config.holderOfKey = SsoClient::Testing::ConfigOf(SsoClient::Testing::Holder());
  return config;
}

}  // namespace SsoClient::Access
