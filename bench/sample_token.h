#ifndef BENCH_SAMPLE_TOKEN_H
#define BENCH_SAMPLE_TOKEN_H

#include <cstddef>
#include <string>

namespace Bench {

/// A signed bearer token, valid now, and the certificate that verifies it.
struct SampleToken {
  std::string xml;
  std::string certificatePem;
};

/// A token of about `size` bytes (at least 2,000), padded with groups. Made once for each size.
const SampleToken& GetSampleToken(std::size_t size);

}  // namespace Bench

#endif
