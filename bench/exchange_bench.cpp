#include <exception>
#include <iostream>
#include <memory>
#include <string>

#include <benchmark/benchmark.h>

#include <ssoclient/ssoclient.h>
#include <tarnik/http/http_url.h>

#include "bare_client.h"
#include "sts/request_builder.h"

// Acquires a token by password, including the whole exchange over TLS, and compares it with a bare
// client that sends the same bytes and does not parse the answer. Each exchange has its own
// connection.
namespace Bench {
namespace {

constexpr char kUser[] = "alice@EXAMPLE.COM";
constexpr char kPassword[] = "secret";

using Service = std::shared_ptr<SsoClient::SecurityTokenService>;

/// A running dev STS and the folder with its certificates.
struct Endpoint {
  std::string url;
  std::string folder;
  bool resumes = false;
};

SsoClient::TokenSpec OneHour() {
  SsoClient::TokenSpec spec;
  spec.tokenLifetimeSec = 3600;
  return spec;
}

Service MakeService(const Endpoint& endpoint) {
  Tarnik::Ssl::SSLContextConfig tls;
  tls.caFiles = {endpoint.folder + "/ca.pem"};
  const auto sslContext = Tarnik::Ssl::CreateSSLContext(tls);
  const auto trustedKeys = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::LoadCertificates(endpoint.folder + "/signing.pem"));
  SsoClient::SecurityTokenServiceConfig config;
  config.url = endpoint.url;
  config.sslContext = sslContext.get();
  config.tokenFactory = SsoClient::CreateSamlTokenFactory(trustedKeys.get());
  return SsoClient::CreateSecurityTokenService(config);
}

void AcquireToken(benchmark::State& state, const Service& service) {
  const auto spec = OneHour();
  for (auto _ : state) {
    benchmark::DoNotOptimize(service->AcquireToken(kUser, kPassword, spec));
  }
}

std::string RequestBytes(const std::string& host, int port, const std::string& target) {
  SsoClient::SoapRequest soap;
  SsoClient::RequestBuilderImpl(boost::none)
      .BuildAcquireTokenRequest(kUser, kPassword, OneHour(), soap);
  return "POST " + target + " HTTP/1.1\r\nHost: " + host + ":" + std::to_string(port) +
         "\r\nContent-Length: " + std::to_string(soap.body.size()) +
         "\r\nContent-Type: text/xml\r\nSOAPAction: \"" + soap.action + "\"\r\n\r\n" + soap.body;
}

/// A bare client, its request, and whether its sessions should be resumed.
struct Bare {
  std::shared_ptr<BareClient> client;
  std::string request;
  bool resumes = false;
};

Bare MakeBare(const Endpoint& endpoint) {
  bool isHttps = false;
  std::string host;
  int port = 0;
  std::string target;
  Tarnik::Http::ParseHttpURL(endpoint.url, isHttps, host, port, target);
  return {std::make_shared<BareClient>(endpoint.folder + "/ca.pem", host,
                                       static_cast<unsigned short>(port)),
          RequestBytes(host, port, target), endpoint.resumes};
}

void BareExchange(benchmark::State& state, const Bare& bare) {
  const std::size_t before = bare.client->Resumed();
  for (auto _ : state) {
    benchmark::DoNotOptimize(bare.client->Exchange(bare.request));
  }
  const auto expected = bare.resumes ? static_cast<std::size_t>(state.iterations()) : 0;
  if (bare.client->Resumed() - before != expected) {
    state.SkipWithError("the bare client did not resume the expected number of sessions");
  }
}

template <class Run, class Subject>
void Add(const std::string& name, Run run, const Subject& subject) {
  benchmark::RegisterBenchmark(name.c_str(), run, subject)
      ->MeasureProcessCPUTime()
      ->UseRealTime()
      ->Unit(benchmark::kMicrosecond);
}

// Makes the first exchange of each, which has no session to resume.
void Register(const std::string& kind, const Endpoint& endpoint) {
  const Service service = MakeService(endpoint);
  service->AcquireToken(kUser, kPassword, OneHour());
  Add("AcquireToken/" + kind, AcquireToken, service);
  const Bare bare = MakeBare(endpoint);
  bare.client->Exchange(bare.request);
  Add("BareExchange/" + kind, BareExchange, bare);
}

}  // namespace
}  // namespace Bench

int main(int argc, char** argv) {
  benchmark::Initialize(&argc, argv);
  if (argc != 5) {
    std::cerr << "usage: exchange_bench [--benchmark_...] URL FOLDER URL_THAT_RESUMES FOLDER\n";
    return 2;
  }
  try {
    Bench::Register("new", {argv[1], argv[2], false});
    Bench::Register("resumed", {argv[3], argv[4], true});
    benchmark::RunSpecifiedBenchmarks();
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "exchange_bench: " << e.what() << '\n';
    return 1;
  }
}
