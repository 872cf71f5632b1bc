#include "end_to_end/end_to_end_fixture.h"

#include <algorithm>
#include <chrono>
#include <thread>

#include "integration/holder_of_key_fixture.h"
#include "support/holder_of_key.h"

namespace SsoClient::Access::Testing {

TokenSourceConfig Trusting(std::initializer_list<const DevSts::Server*> servers) {
  Tarnik::Ssl::SSLContextConfig tls;
  std::vector<Tarnik::Ref<const Tarnik::Crypto::Certificate>> signers;
  if (servers.size() == 0) {
    // A resolver trusts at least one.
    signers.push_back(
        Tarnik::Crypto::CreateCertificatesFromPem(SsoClient::Testing::Stranger().certificatePem)
            .front());
  }
  for (const DevSts::Server* server : servers) {
    for (const auto& ca : Tarnik::Crypto::CreateCertificatesFromPem(server->CaCertificatePem())) {
      tls.caCertificates.push_back(ca);
    }
    signers.push_back(
        Tarnik::Crypto::CreateCertificatesFromPem(server->SigningCertificatePem()).front());
  }
  TokenSourceConfig config;
  config.sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  const auto resolver =
      Tarnik::Xml::Security::CreateTrustedCertificatesResolver({signers.begin(), signers.end()});
  config.tokenFactory = CreateSamlTokenFactory(resolver.get());
  config.login = PasswordLogin{kUser, [] { return std::string(kPassword); }};
  return config;
}

TokenSourceConfig ConfigFor(std::initializer_list<const DevSts::Server*> servers) {
  TokenSourceConfig config = Trusting(servers);
  for (const DevSts::Server* server : servers) {
    config.endpoints.push_back({server->HttpsUrl(), ""});
  }
  return config;
}

TokenSourceConfig BoundConfigFor(std::initializer_list<const DevSts::Server*> servers) {
  TokenSourceConfig config = ConfigFor(servers);
  config.holderOfKey = SsoClient::Testing::ConfigOf(SsoClient::Testing::Holder());
  return config;
}

DevSts::ServerOptions Passing(Gate& gate) {
  DevSts::ServerOptions options;
  options.onRequest = [&gate](const DevSts::ReceivedRequest&) { gate.Pass(); };
  return options;
}

DevSts::Misbehavior Stalling(DevSts::Stall stall) {
  DevSts::Misbehavior misbehavior;
  misbehavior.stall = stall;
  return misbehavior;
}

DevSts::Misbehavior Answering(int status, const std::string& retryAfter) {
  DevSts::Misbehavior misbehavior;
  misbehavior.httpAnswer = DevSts::HttpAnswer{status, "Busy", {}, "later"};
  if (!retryAfter.empty()) {
    misbehavior.httpAnswer->headers.emplace_back("Retry-After", retryAfter);
  }
  return misbehavior;
}

DevSts::Misbehavior Resetting() {
  DevSts::Misbehavior misbehavior;
  misbehavior.cutOff = DevSts::CutOff{0, DevSts::CutStyle::Reset};
  return misbehavior;
}

DevSts::Misbehavior Refusing(const std::string& faultCode) {
  DevSts::Misbehavior misbehavior;
  misbehavior.fault = DevSts::FaultAnswer{SsoClient::Testing::kTrust, faultCode, "why", false, 500};
  return misbehavior;
}

std::vector<AttemptRecord> EndToEndTest::AwaitEnded(std::size_t count) const {
  EXPECT_TRUE(listener_->Await([&](const Records& seen) { return seen.ended.size() >= count; }));
  auto attempts = listener_->Seen().ended;
  std::sort(attempts.begin(), attempts.end(),
            [](const AttemptRecord& a, const AttemptRecord& b) { return a.id < b.id; });
  return attempts;
}

bool EndToEndTest::AwaitCircuit(const std::string& endpoint, CircuitState state) const {
  return listener_->Await([&](const Records& seen) {
    return std::any_of(seen.circuits.begin(), seen.circuits.end(),
                       [&](const CircuitRecord& circuit) {
                         return circuit.endpoint == endpoint && circuit.state == state;
                       });
  });
}

std::size_t RequestsOf(std::initializer_list<const DevSts::Server*> servers) {
  std::size_t requests = 0;
  for (const DevSts::Server* server : servers) {
    requests += server->Requests().size();
  }
  return requests;
}

void AwaitCallers(const TokenSource& source, std::size_t count) {
  const auto limit = std::chrono::steady_clock::now() + std::chrono::minutes(1);
  while (source.Metrics().callersWaiting != count) {
    ASSERT_LT(std::chrono::steady_clock::now(), limit)
        << source.Metrics().callersWaiting << " callers wait, not " << count;
    std::this_thread::yield();
  }
}

}  // namespace SsoClient::Access::Testing
