// Measures a token gate with tokens of several sizes. Prints for each
//  "gate SIZE BYTES MISS HIT ALLOCATIONS": the nanoseconds of a check that reads the token, of one
//    that finds it in the cache, and the allocations of the latter;
//  "memory SIZE BYTES USED COUNTED": the bytes of heap memory for each remembered token, including
//    the overhead of the allocator, and the bytes that the gate counts for it;
// and then "threads NANOSECONDS RATIO": the time of a hit while another thread makes checks as
// well, and the checks of two threads divided by those of one in the same time. Each thread
// presents tokens of its own, or "same" for one token of both. The best round of each counts.
#include <algorithm>
#include <array>
#include <barrier>
#include <chrono>
#include <cstdio>
#include <exception>
#include <iostream>
#include <limits>
#include <memory>
#include <string>
#include <thread>
#include <vector>

#include <malloc.h>

#include <ssoclient/access/token_gate.h>

#include "allocation_count.h"
#include "sample_gate.h"
#include "sample_token.h"

namespace Bench {
namespace {

using Clock = std::chrono::steady_clock;
using SsoClient::Access::TokenGate;

constexpr int kRounds = 200;
constexpr std::size_t kMisses = 40;
constexpr std::size_t kHits = 400;
constexpr std::size_t kThreadSize = 6000;

double NanosecondsPerCheck(const TokenGate& gate, const std::string& xml, std::size_t checks) {
  const auto begin = Clock::now();
  for (std::size_t i = 0; i < checks; ++i) {
    CheckAccepted(gate, xml);
  }
  return std::chrono::duration<double, std::nano>(Clock::now() - begin).count() /
         static_cast<double>(checks);
}

/// A token of one size, with a gate that remembers it and one that remembers nothing.
class Kind {
 public:
  explicit Kind(std::size_t size)
      : size_(size),
        sample_(GetSampleToken(size)),
        missing_(MakeSampleGate(sample_, 0)),
        hitting_(MakeSampleGate(sample_, 1000)) {}

  void Measure() {
    miss_ = std::min(miss_, NanosecondsPerCheck(*missing_, sample_.xml, kMisses));
    CheckAccepted(*hitting_, sample_.xml);
    const std::size_t before = CountAllocations();
    hit_ = std::min(hit_, NanosecondsPerCheck(*hitting_, sample_.xml, kHits));
    allocations_ = (CountAllocations() - before + kHits - 1) / kHits;
  }
  void Print() const {
    std::printf("gate %zu %zu %.0f %.0f %zu\n", size_, sample_.xml.size(), miss_, hit_,
                allocations_);
  }

 private:
  std::size_t size_;
  const SampleToken& sample_;
  std::shared_ptr<TokenGate> missing_;
  std::shared_ptr<TokenGate> hitting_;
  double miss_ = std::numeric_limits<double>::max();
  double hit_ = std::numeric_limits<double>::max();
  std::size_t allocations_ = 0;
};

std::size_t HeapInUse() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

void PrintMemory(std::size_t size) {
  constexpr std::size_t kTokens = 64;
  const SampleToken& sample = GetSampleToken(size);
  // White space after the assertion makes different texts of nearly the same length.
  std::vector<std::string> texts;
  for (std::size_t i = 0; i < kTokens; ++i) {
    texts.push_back(sample.xml + std::string(i, ' '));
  }
  const auto gate = MakeSampleGate(sample, 1000);
  CheckAccepted(*MakeSampleGate(sample, 0), sample.xml);
  const std::size_t before = HeapInUse();
  for (const std::string& text : texts) {
    CheckAccepted(*gate, text);
  }
  const std::size_t used = HeapInUse() - before;
  const SsoClient::Access::GateMetrics metrics = gate->Metrics();
  std::printf("memory %zu %zu %zu %zu\n", size, sample.xml.size(), used / metrics.cachedTokens,
              metrics.cachedBytes / metrics.cachedTokens);
}

/// The time of a hit on each of two threads that begin together; the longer one.
double NanosecondsPerHitOfTwo(const TokenGate& gate, const std::string& first,
                              const std::string& second) {
  std::barrier ready(2);
  std::array<double, 2> times{};
  const auto run = [&](std::size_t index, const std::string& xml) {
    CheckAccepted(gate, xml);
    ready.arrive_and_wait();
    times[index] = NanosecondsPerCheck(gate, xml, kHits);
  };
  std::thread other(run, 1, std::cref(second));
  run(0, first);
  other.join();
  return std::max(times[0], times[1]);
}

void PrintThreads() {
  const SampleToken& sample = GetSampleToken(kThreadSize);
  const auto gate = MakeSampleGate(sample, 10'000);
  const std::string other = sample.xml + " ";
  double one = std::numeric_limits<double>::max();
  double two = one;
  double same = one;
  for (int round = 0; round < kRounds; ++round) {
    CheckAccepted(*gate, sample.xml);
    one = std::min(one, NanosecondsPerCheck(*gate, sample.xml, kHits));
    two = std::min(two, NanosecondsPerHitOfTwo(*gate, sample.xml, other));
    same = std::min(same, NanosecondsPerHitOfTwo(*gate, sample.xml, sample.xml));
  }
  std::printf("threads %.0f %.2f\nsame %.0f %.2f\n", two, 2 * one / two, same, 2 * one / same);
}

void Run() {
  std::vector<Kind> kinds;
  for (const std::size_t size : {2000UL, 6000UL, 60000UL}) {
    PrintMemory(size);
    kinds.emplace_back(size);
  }
  for (int round = 0; round < kRounds; ++round) {
    for (Kind& kind : kinds) {
      kind.Measure();
    }
  }
  for (const Kind& kind : kinds) {
    kind.Print();
  }
  PrintThreads();
}

}  // namespace
}  // namespace Bench

int main() {
  try {
    Bench::Run();
    return 0;
  } catch (const std::exception& e) {
    std::cerr << "gate_bench: " << e.what() << '\n';
    return 1;
  }
}
