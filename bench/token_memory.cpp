// Prints for each size of token: the requested size, the bytes of its text, and the bytes of heap
// memory that one token uses, including the overhead of the allocator.
#include <cstdio>
#include <memory>
#include <vector>

#include <malloc.h>

#include <ssoclient/saml_token.h>

#include "sample_token.h"

namespace Bench {
namespace {

std::size_t HeapInUse() {
  const struct mallinfo2 info = mallinfo2();
  return info.uordblks + info.hblkhd;
}

double TokenMemory(std::size_t size) {
  constexpr std::size_t kTokens = 64;
  const std::string& xml = GetSampleToken(size).xml;
  std::vector<std::shared_ptr<const SsoClient::SamlToken>> tokens;
  tokens.reserve(kTokens);
  // The first token fills shared caches.
  SsoClient::CreateSamlToken(xml);
  const std::size_t before = HeapInUse();
  for (std::size_t i = 0; i < kTokens; ++i) {
    tokens.push_back(SsoClient::CreateSamlToken(xml));
  }
  return static_cast<double>(HeapInUse() - before) / kTokens;
}

}  // namespace
}  // namespace Bench

int main() {
  for (const std::size_t size : {2000UL, 6000UL, 60000UL, 600000UL}) {
    const std::size_t bytes = Bench::GetSampleToken(size).xml.size();
    std::printf("%zu %zu %.0f\n", size, bytes, Bench::TokenMemory(size));
  }
  return 0;
}
