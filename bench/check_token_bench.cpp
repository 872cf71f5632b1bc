#include <benchmark/benchmark.h>

#include <ssoclient/saml_token.h>
#include <tarnik/crypto/certificate.h>
#include <tarnik/xml/security/key_info_resolver.h>

#include "floor.h"
#include "peer.h"
#include "sample_token.h"
#include "tokenizer.h"

namespace Bench {
namespace {

void ForEachSize(benchmark::internal::Benchmark* run) {
  run->Arg(2000)->Arg(6000)->Arg(60000)->Arg(600000)->Unit(benchmark::kMicrosecond);
}

std::size_t SizeOf(const benchmark::State& state) {
  return static_cast<std::size_t>(state.range(0));
}

// NOLINTBEGIN(performance-unnecessary-value-param): the benchmark library's form
void CheckToken(benchmark::State& state) {
  const SampleToken& sample = GetSampleToken(SizeOf(state));
  const auto resolver = Tarnik::Xml::Security::CreateTrustedCertificatesResolver(
      Tarnik::Crypto::CreateCertificatesFromPem(sample.certificatePem));
  for (auto _ : state) {
    benchmark::DoNotOptimize(SsoClient::CreateSamlToken(sample.xml, resolver.get()));
  }
}
BENCHMARK(CheckToken)->Apply(ForEachSize);

void PeerCheck(benchmark::State& state) {
  const SampleToken& sample = GetSampleToken(SizeOf(state));
  Peer peer(sample.certificatePem);
  for (auto _ : state) {
    if (!peer.Check(sample.xml)) {
      state.SkipWithError("the peer refuses the token");
      break;
    }
  }
}
BENCHMARK(PeerCheck)->Apply(ForEachSize);

void FloorCheck(benchmark::State& state) {
  const SampleToken& sample = GetSampleToken(SizeOf(state));
  Floor floor;
  for (auto _ : state) {
    if (!floor.Check(sample.xml)) {
      state.SkipWithError("the floor's signature does not verify");
      break;
    }
  }
}
BENCHMARK(FloorCheck)->Apply(ForEachSize);

void TokenizerTree(benchmark::State& state) {
  const SampleToken& sample = GetSampleToken(SizeOf(state));
  for (auto _ : state) {
    if (!Tokenize(sample.xml)) {
      state.SkipWithError("the tokenizer refuses the token");
      break;
    }
  }
}
BENCHMARK(TokenizerTree)->Apply(ForEachSize);
// NOLINTEND(performance-unnecessary-value-param)

}  // namespace
}  // namespace Bench

BENCHMARK_MAIN();
