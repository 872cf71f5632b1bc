#include <exception>
#include <iostream>
#include <memory>
#include <string>

#include <benchmark/benchmark.h>

#include <ssoclient/access/token_source.h>
#include <ssoclient/ssoclient.h>
#include <tarnik/http/connection_specs.h>
#include <tarnik/http/http_url.h>
#include <tarnik/http/http_user_agent.h>

// Acquires a token by password from a token source whose cache is empty, and compares it with the
// client's own operation. Both keep their connection to the dev STS, over TLS.
namespace Bench {
namespace {

constexpr char kUser[] = "alice@EXAMPLE.COM";
constexpr char kPassword[] = "secret";

/// A running dev STS and the folder with its certificates.
struct DevSts {
  std::string url;
  std::string folder;
};

SsoClient::TokenSpec OneHour() {
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  return spec;
}

Tarnik::Ref<Tarnik::Ssl::SSLContext> MakeSslContext(const DevSts& sts) {
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {sts.folder + "/ca.pem"};
  return Tarnik::Ssl::CreateSSLContext(tls);
}

std::shared_ptr<SsoClient::SamlTokenFactory> MakeFactory(const DevSts& sts) {
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(sts.folder + "/signing.pem"));
  return SsoClient::CreateSamlTokenFactory(trustedKeys.get());
}

void AcquireByClient(benchmark::State& state, const DevSts& sts) {
  bool isHttps = false;
  std::string host;
  int port = 0;
  SsoClient::SecurityTokenServiceConfigEx config;
  Tarnik::Http::ParseHttpURL(sts.url, isHttps, host, port, config.url);
  const auto sslContext = MakeSslContext(sts);
  const auto connections = Tarnik::Http::CreateTLSConnectionSpec(host, port, sslContext.get(), "");
  config.userAgent = Tarnik::Http::CreateHttpUserAgent(connections.get(), nullptr, nullptr);
  config.tokenFactory = MakeFactory(sts);
  const auto service = SsoClient::CreateSecurityTokenService(config);
  const auto spec = OneHour();
  service->AcquireToken(kUser, kPassword, spec);  // connects
  for (auto _ : state) {
    benchmark::DoNotOptimize(service->AcquireToken(kUser, kPassword, spec));
  }
}

void AcquireBySource(benchmark::State& state, const DevSts& sts) {
  SsoClient::Access::TokenSourceConfig config;
  config.endpoints = {{sts.url, ""}};
  config.sslContext = MakeSslContext(sts);
  config.tokenFactory = MakeFactory(sts);
  config.login = SsoClient::Access::PasswordLogin{kUser, [] { return std::string(kPassword); }};
  const auto source = SsoClient::Access::CreateTokenSource(config);
  const auto spec = OneHour();
  auto token = source->GetToken(spec);  // connects
  for (auto _ : state) {
    source->Invalidate(*token);
    token = source->GetToken(spec);
  }
  const auto metrics = source->Metrics();
  if (metrics.hits != 0 || metrics.logins != static_cast<std::uint64_t>(state.iterations()) + 1) {
    state.SkipWithError("a call was answered from the cache, or failed");
  }
}

template <class Run>
void Add(const std::string& name, Run run, const DevSts& sts) {
  benchmark::RegisterBenchmark(name.c_str(), run, sts)
      ->Iterations(
          25)  // the same for both, or the shorter one has the better chance of a good moment
      ->MeasureProcessCPUTime()
      ->UseRealTime()
      ->Unit(benchmark::kMicrosecond);
}

}  // namespace
}  // namespace Bench

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (argc != 3) {
    std::cerr << "usage: token_source_bench [--benchmark_...] URL FOLDER\n";
    return 2;
  }
  try {
    const Bench::DevSts sts{argv[1], argv[2]};
    Bench::Add("ByClient", Bench::AcquireByClient, sts);
    Bench::Add("BySource", Bench::AcquireBySource, sts);
    benchmark::RunSpecifiedBenchmarks();
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "token_source_bench: " << e.what() << '\n';
    return 1;
  }
}
