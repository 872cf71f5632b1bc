#ifndef BENCH_SAMPLE_GATE_H
#define BENCH_SAMPLE_GATE_H

#include <cstddef>
#include <memory>
#include <string>

#include <ssoclient/access/token_gate.h>

#include "sample_token.h"

namespace Bench {

/// A gate that accepts `sample` and remembers at most `cachedTokens` tokens.
std::shared_ptr<SsoClient::Access::TokenGate> MakeSampleGate(const SampleToken& sample,
                                                             std::size_t cachedTokens);

/// Throws `std::runtime_error` if the gate refuses the token.
void CheckAccepted(const SsoClient::Access::TokenGate& gate, const std::string& xml);

}  // namespace Bench

#endif
